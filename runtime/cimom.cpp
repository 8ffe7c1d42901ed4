#include "runtime/cimom.h"

#include <cassert>
#include <cstdio>

namespace cimple {

Instance_Enumerator::~Instance_Enumerator()
{
    close();
}

// Without a context nobody could free the enumeration; it stays for a call that has one.
void Instance_Enumerator::close()
{
    Thread_Context* context = Thread_Context::top();
    if (!m_rep || !context) return;
    Instance_Enumerator_Rep* rep = m_rep;
    m_rep = nullptr;
    context->instance_enumerator_destroy(rep);
}

bool Instance_Enumerator::more() const
{
    Thread_Context* context = Thread_Context::top();
    return m_rep && context && context->instance_enumerator_more(m_rep);
}

void Instance_Enumerator::next()
{
    Thread_Context* context = Thread_Context::top();
    if (m_rep && context) context->instance_enumerator_next(m_rep);
}

Ref<Instance> Instance_Enumerator::get() const
{
    Thread_Context* context = Thread_Context::top();
    return Ref<Instance>(m_rep && context ? context->instance_enumerator_get(m_rep) : nullptr);
}

int cimom::enum_instances(const char* name_space, const Instance* model, Instance_Enumerator& enumerator)
{
    enumerator.close();
    Thread_Context* context = Thread_Context::top();
    if (!context) return -1;
    enumerator.m_rep = context->instance_enumerator_create(name_space, model);
    return enumerator.m_rep ? 0 : -1;
}

int cimom::enum_instances(const char*, const Instance*, Array<Instance>&)
{
    std::printf("NOT IMPLEMENTED.");
    std::fflush(stdout);
    assert(false);
    return -1;
}

Instance* cimom::get_instance(const char* name_space, const Instance* model)
{
    Thread_Context* context = Thread_Context::top();
    return context ? context->get_instance(name_space, model) : nullptr;
}

int cimom::create_instance(const char* name_space, const Instance* instance)
{
    Thread_Context* context = Thread_Context::top();
    return context ? context->create_instance(name_space, instance) : -1;
}

int cimom::delete_instance(const char* name_space, const Instance* instance)
{
    Thread_Context* context = Thread_Context::top();
    return context ? context->delete_instance(name_space, instance) : -1;
}

int cimom::modify_instance(const char* name_space, const Instance* instance)
{
    Thread_Context* context = Thread_Context::top();
    return context ? context->modify_instance(name_space, instance) : -1;
}

int cimom::invoke_method(const char* name_space, const Instance* instance, Instance* method)
{
    Thread_Context* context = Thread_Context::top();
    return context ? context->invoke_method(name_space, instance, method) : -1;
}

void cimom::allow_unload(bool flag)
{
    if (Thread_Context* context = Thread_Context::top()) context->allow_unload(flag);
}

bool cimom::get_username(String& name)
{
    Thread_Context* context = Thread_Context::top();
    return context && context->get_username(name);
}

} // namespace cimple
