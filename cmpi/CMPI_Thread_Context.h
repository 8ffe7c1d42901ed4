/// A thread's way to the CIM server through CMPI: a broker and a context, and the up-calls over them.
///
/// One is pushed for the length of each request, on the stack of the function that the server called; one is made for
/// each thread that the module starts, by the thread that starts it, and counts as a user of the adapter until it is
/// deleted. It owns neither broker nor context, but for the prepared context of a thread that never came to attach it.
/// Belongs to one thread. No operation throws anything but std::bad_alloc.
#pragma once

#include <cmpift.h>

#include "runtime/Thread_Context.h"

namespace cimple {

class CMPI_Adapter;

class CMPI_Thread_Context final : public Thread_Context {
public:
    const CMPIBroker* broker;
    const CMPIContext* context;
    CMPI_Adapter* adapter;

    /// For a request: everything is lent until the request ends.
    CMPI_Thread_Context(const CMPIBroker* broker, const CMPIContext* context, CMPI_Adapter* adapter);
    ~CMPI_Thread_Context() override;

    Thread_Context* thread_create_hook(void* arg) override;
    void thread_start_hook() override;
    void thread_exit_hook() override;

    Instance_Enumerator_Rep* instance_enumerator_create(const char* name_space, const Instance* model) override;
    void instance_enumerator_destroy(Instance_Enumerator_Rep* enumerator) override;
    bool instance_enumerator_more(Instance_Enumerator_Rep* enumerator) override;
    void instance_enumerator_next(Instance_Enumerator_Rep* enumerator) override;
    Instance* instance_enumerator_get(Instance_Enumerator_Rep* enumerator) override;

    Instance* get_instance(const char* name_space, const Instance* model) override;
    int create_instance(const char* name_space, const Instance* instance) override;
    int delete_instance(const char* name_space, const Instance* instance) override;
    int modify_instance(const char* name_space, const Instance* instance) override;
    int invoke_method(const char* name_space, const Instance* instance, Instance* method) override;
    void allow_unload(bool flag) override;
    bool get_username(String& name) override;

private:
    // Of a thread's own context; a request's is only lent.
    enum class Attachment { lent, prepared, attached, detached };

    Attachment m_attachment = Attachment::lent;
};

/// Makes a context the calling thread's current one for a scope.
class Pushed_Context {
public:
    explicit Pushed_Context(CMPI_Thread_Context& context) { Thread_Context::push(&context); }
    ~Pushed_Context() { Thread_Context::pop(); }
    Pushed_Context(const Pushed_Context&) = delete;
    Pushed_Context& operator=(const Pushed_Context&) = delete;
};

} // namespace cimple
