/// A registered provider, driven through its proc as the bridge does.
#pragma once

#include "classes/repository.h"
#include "runtime/Registration.h"

#include <stdexcept>
#include <string>
#include <vector>

namespace cimple {

/// What a handler was called with.
struct Handled {
    std::vector<int> statuses; ///< of all calls, in order
    int closings = 0;          ///< calls with no instance

    static bool take(Instance* instance, int status, void* data)
    {
        auto& handled = *static_cast<Handled*>(data);
        handled.statuses.push_back(status);
        if (!instance) ++handled.closings;
        unref(instance);
        return true;
    }
    void* proc() const { return reinterpret_cast<void*>(&Handled::take); }
};

/// Creates the provider of a class with OP_CREATE_PROVIDER and destroys it at its end.
class Proc {
public:
    explicit Proc(const std::string& class_name)
    {
        for (m_registration = cimple_module(); m_registration; m_registration = m_registration->next)
            if (class_name + "_Provider" == m_registration->provider_name) break;
        if (!m_registration) throw std::runtime_error("no provider of " + class_name);
        call(OP_CREATE_PROVIDER, &m_provider);
    }
    ~Proc() { call(OP_DESTROY_PROVIDER, m_provider); }
    Proc(const Proc&) = delete;
    Proc& operator=(const Proc&) = delete;

    /// An operation with its words from the first on.
    int call(int code, void* arg0 = nullptr, void* arg1 = nullptr, void* arg2 = nullptr, void* arg3 = nullptr,
             void* arg4 = nullptr, void* arg5 = nullptr, void* arg6 = nullptr, void* arg7 = nullptr) const
    {
        return m_registration->proc(m_registration, code, arg0, arg1, arg2, arg3, arg4, arg5, arg6, arg7);
    }
    int enumerate(Handled& handled) const
    {
        return call(OP_ENUM_INSTANCES, m_provider, nullptr, handled.proc(), &handled);
    }
    /// Calls the method by the record's `meta_class`; the record stays the caller's.
    int invoke(Instance* record) const { return call(OP_INVOKE_METHOD, m_provider, nullptr, record); }

    void* provider() const { return m_provider; }
    const Meta_Class* meta_class() const { return m_registration->meta_class; }

private:
    const Registration* m_registration = nullptr;
    void* m_provider = nullptr;
};

} // namespace cimple
