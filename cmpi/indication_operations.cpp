#include <cassert>
#include <vector>

#include "cmpi/Converter.h"
#include "cmpi/indication.h"
#include "cmpi/operation.h"
#include "cmpi/operations.h"

namespace cimple {

namespace {

std::size_t find_filter(const Array<Filter_Record>& filters, const String& name_space)
{
    std::size_t i = 0;
    while (i < filters.size() && !(filters[i].name_space == name_space))
        ++i;
    return i;
}

void add_filter(Array<Filter_Record>& filters, const String& name_space)
{
    std::size_t i = find_filter(filters, name_space);
    if (i < filters.size()) {
        ++filters[i].count;
    } else {
        Filter_Record record;
        record.name_space = name_space;
        record.count = 1;
        filters.append(record);
    }
}

void remove_filter(Array<Filter_Record>& filters, const String& name_space)
{
    std::size_t i = find_filter(filters, name_space);
    if (i == filters.size()) return;
    if (filters[i].count > 1)
        --filters[i].count;
    else
        filters.remove(i);
}

// The frame of the two filter operations, which need no thread context.
CMPIStatus change_filters(CMPIIndicationMI* mi, const CMPIObjectPath* op, const char* label,
                          void (*change)(Array<Filter_Record>&, const String&))
{
    return guarded([&] {
        Adapter_Use adapter(tables_of(mi));
        if (!adapter) return CMPI_RC_ERR_FAILED;
        Auto_Mutex locked(adapter->lock);
        log_enter(label);
        const String name_space = name_space_of(op); // a call of the server's: not under the innermost mutex
        {
            Auto_Mutex filters_locked(adapter->filters_lock);
            change(adapter->filters, name_space);
        }
        log_return(label, CMPI_RC_OK);
        return CMPI_RC_OK;
    });
}

CMPIStatus always_ok(const char* label)
{
    log_enter(label);
    log_return(label, CMPI_RC_OK);
    return status_of(CMPI_RC_OK);
}

} // namespace

bool _indication_proc(Instance* instance, void* data)
{
    Ref<Instance> owned(instance);
    if (!instance) return false;
    auto* adapter = static_cast<CMPI_Adapter*>(data);

    // A copy: a delivery may take as long as the server likes, and a filter may come or go meanwhile.
    std::vector<String> name_spaces;
    {
        Auto_Mutex locked(adapter->filters_lock);
        for (const Filter_Record& filter : adapter->filters)
            name_spaces.push_back(filter.name_space);
    }

    for (const String& name_space : name_spaces) {
        Made<CMPIInstance> made;
        if (make_CMPI_instance(adapter->broker, instance, name_space.c_str(), nullptr, nullptr, made) != 0) continue;
        auto* thread_context = dynamic_cast<CMPI_Thread_Context*>(Thread_Context::top());
        assert(thread_context != 0);
        tell(adapter->broker, &CMPIBrokerFT::deliverIndication, thread_context->context, name_space.c_str(),
             made.get());
    }
    return true;
}

CMPIStatus authorizeFilter(CMPIIndicationMI*, const CMPIContext*, const CMPISelectExp*, const char*,
                           const CMPIObjectPath*, const char*)
{
    return always_ok("authorizeFilter");
}

CMPIStatus mustPoll(CMPIIndicationMI*, const CMPIContext*, const CMPISelectExp*, const char*, const CMPIObjectPath*)
{
    return always_ok("mustPoll");
}

CMPIStatus activateFilter(CMPIIndicationMI* mi, const CMPIContext*, const CMPISelectExp*, const char*,
                          const CMPIObjectPath* op, CMPIBoolean)
{
    return change_filters(mi, op, "activateFilter", add_filter);
}

CMPIStatus deActivateFilter(CMPIIndicationMI* mi, const CMPIContext*, const CMPISelectExp*, const char*,
                            const CMPIObjectPath* op, CMPIBoolean)
{
    return change_filters(mi, op, "deActivateFilter", remove_filter);
}

CMPIStatus enableIndications(CMPIIndicationMI* mi, const CMPIContext* ctx)
{
    return operate(mi, ctx, "enableIndications", [&](CMPI_Adapter& adapter) -> Outcome {
        if (adapter.indications_enabled) return CMPI_RC_OK;
        adapter.indications_enabled = true;
        return enable_indications_codes.code(
            adapter.call(OP_ENABLE_INDICATIONS, adapter.provider, &_indication_proc, &adapter));
    });
}

CMPIStatus disableIndications(CMPIIndicationMI* mi, const CMPIContext* ctx)
{
    return operate(mi, ctx, "disableIndications", [&](CMPI_Adapter& adapter) -> Outcome {
        if (!adapter.indications_enabled) return CMPI_RC_OK;
        int status = adapter.call(OP_DISABLE_INDICATIONS, adapter.provider);
        adapter.indications_enabled = false;
        return disable_indications_codes.code(status);
    });
}

} // namespace cimple
