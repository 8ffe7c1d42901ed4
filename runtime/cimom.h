/// Up-calls: what a provider asks the CIM server, through the calling thread's Thread_Context.
///
/// Each operation forwards to the top context of the calling thread; without one it fails politely with the value told.
/// A call may block as long as the server takes, and the server may call back into this module on another thread.
#pragma once

#include "runtime/Thread_Context.h"

namespace cimple {

/// A walk over the instances of an up-call; opened by cimom::enum_instances. Must end on the thread that opened it.
class Instance_Enumerator {
public:
    Instance_Enumerator() = default;
    ~Instance_Enumerator();
    Instance_Enumerator(const Instance_Enumerator&) = delete;
    Instance_Enumerator& operator=(const Instance_Enumerator&) = delete;

    /// Is there a current instance?
    bool more() const;
    /// Goes on to the next instance.
    void next();
    /// The current instance, or an empty Ref.
    Ref<Instance> get() const;

private:
    friend class cimom;
    void close();
    Instance_Enumerator_Rep* m_rep = nullptr;
};

class cimom {
public:
    /// Opens an enumeration of the model's class; one that `enumerator` still holds is destroyed first. 0 or -1.
    static int enum_instances(const char* name_space, const Instance* model, Instance_Enumerator& enumerator);
    /// Not to be called: writes "NOT IMPLEMENTED." and ends the process by assertion.
    static int enum_instances(const char* name_space, const Instance* model, Array<Instance>& instances);
    /// An instance with one count for the caller, or null.
    static Instance* get_instance(const char* name_space, const Instance* model);
    /// 0 or -1.
    static int create_instance(const char* name_space, const Instance* instance);
    static int delete_instance(const char* name_space, const Instance* instance);
    static int modify_instance(const char* name_space, const Instance* instance);
    static int invoke_method(const char* name_space, const Instance* instance, Instance* method);
    /// Lets the server unload the provider while idle, or not.
    static void allow_unload(bool flag);
    /// The name of the user that the request was made for; false without a context or a name.
    static bool get_username(String& name);
};

} // namespace cimple
