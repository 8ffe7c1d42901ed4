// Frame tagging: the CPQFC_* library.
#include "simulator/Call.h"

using namespace nvrsim;

uint32_t nvrsim_CPQFC_LoadLibrary()
{
    return run<uint32_t>(Call_Id::CPQFC_LoadLibrary, {}, 1, [](Call&) { return RM_STATUS_OK; });
}

uint32_t nvrsim_CPQFC_FreeLibrary()
{
    return run<uint32_t>(Call_Id::CPQFC_FreeLibrary, {}, 1, [](Call&) { return RM_STATUS_OK; });
}

uint32_t nvrsim_CPQFC_GetNumberOfAdapters()
{
    return run<uint32_t>(Call_Id::CPQFC_GetNumberOfAdapters, {}, 1,
                         [](Call& call) -> uint64_t { return call.count(call.simulator().count_present()); });
}

uint32_t nvrsim_CPQFC_OpenAdapter(const char* name)
{
    return run<uint32_t>(Call_Id::CPQFC_OpenAdapter, Subject::of_name(name), 1, [](Call& call) -> uint32_t {
        if (!call.adapter() || !call.adapter()->present || call.keeps_handle()) return 0;
        return call.simulator().open(call.adapter()->name, true);
    });
}

void nvrsim_CPQFC_CloseAdapter(uint32_t handle)
{
    run<uint32_t>(Call_Id::CPQFC_CloseAdapter, Subject::of_tags(handle), 0, [&](Call& call) {
        if (call.adapter()) call.simulator().handles.erase(handle);
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_CPQFC_QoSGetConfig(uint32_t handle, CPQFC_QOSCONFIG* config)
{
    return run_on_adapter(Call_Id::CPQFC_QoSGetConfig, Subject::of_tags(handle), [&](Call& call, Adapter& adapter) {
        if (!config) return RM_STATUS_ARGUMENT;
        const uint32_t capacity = config->count;
        call.number(&config->count, adapter.tags.size());
        if (capacity < adapter.tags.size()) return RM_STATUS_MORE_DATA;
        for (size_t i = 0; i < adapter.tags.size(); ++i) {
            CPQFC_QOSENTRY entry{};
            entry.source = to_wire(adapter.tags[i].source);
            entry.target = to_wire(adapter.tags[i].target);
            entry.tag = adapter.tags[i].tag;
            call.bytes(config->entry + i, &entry, sizeof entry);
        }
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_CPQFC_QoSSetConfig(uint32_t handle, const CPQFC_QOSCONFIG* config)
{
    return run_on_adapter(Call_Id::CPQFC_QoSSetConfig, Subject::of_tags(handle), [&](Call&, Adapter& adapter) {
        if (!config || config->count > CPQFC_QOS_MAX_ENTRIES) return RM_STATUS_ARGUMENT;
        std::vector<Tag_Entry> tags;
        for (uint32_t i = 0; i < config->count; ++i) {
            const CPQFC_QOSENTRY& entry = config->entry[i];
            tags.push_back({to_number(entry.source), to_number(entry.target), entry.tag});
        }
        adapter.tags.swap(tags);
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_CPQFC_QoSGetGlobalFlag(uint32_t handle, uint32_t* flag)
{
    return run_on_adapter(Call_Id::CPQFC_QoSGetGlobalFlag, Subject::of_tags(handle), [&](Call& call, Adapter& adapter) {
        call.answer(flag, adapter.tagFlag);
        return flag ? RM_STATUS_OK : RM_STATUS_ARGUMENT;
    });
}

uint32_t nvrsim_CPQFC_QoSSetGlobalFlag(uint32_t handle, uint32_t flag)
{
    return run_on_adapter(Call_Id::CPQFC_QoSSetGlobalFlag, Subject::of_tags(handle), [&](Call&, Adapter& adapter) {
        adapter.tagFlag = flag;
        return RM_STATUS_OK;
    });
}
