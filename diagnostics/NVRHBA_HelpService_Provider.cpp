#include "diagnostics/NVRHBA_HelpService_Provider.h"

#include "agent/Agent_Wait.h"
#include "agent/enumerate.h"
#include "agent/instance_table.h"
#include "agent/method_answer.h"
#include "foundation/CLogger.h"

namespace cimple {

namespace {

constexpr uint16 as_string = 1; // the one format and the one delivery

/// The service of that name which has the document; null if there is none.
const NVRHBA_HelpService* findDocument(const Map<NVRHBA_HelpService>& services, const String& name,
                                       const String& document)
{
    for (std::size_t i = 0; i < services.size(); i++) {
        const Property<Array<String>>& available = services[i]->DocumentsAvailable;
        if (!available.null && available.value.size() > 0 && available.value[0] == document &&
            services[i]->Name.value == name)
            return services[i];
    }
    return nullptr;
}

uint32 help(ProviderAgent& agent, const Instance* self, const Property<String>& document,
            const Property<uint16>& format, const Property<uint16>& delivery, Property<String>& info)
{
    const auto* service = agent.m_NVRHBA_HelpService_map.lookup_own(self);
    if (!service) {
        NVR_LOG("Invalid instance of Help Service");
        return ANSWER_INVALID_PARAMETER;
    }
    if (document.null || delivery.null || format.null) {
        NVR_LOG("Invalid Requested Document");
        return ANSWER_INVALID_PARAMETER;
    }
    service = findDocument(agent.m_NVRHBA_HelpService_map, service->Name.value, document.value);
    if (!service) return ANSWER_FAILED;
    if (delivery.value != as_string || format.value != as_string) {
        NVR_LOG("Unsupported Delivery options, Use '1' for proper support");
        return ANSWER_INVALID_PARAMETER;
    }
    const Array<String>& descriptions = service->DocumentDescriptions.value;
    set(info, descriptions.size() > 0 ? descriptions[0] : String());
    return ANSWER_DONE;
}

} // namespace

Enum_Instances_Status NVRHBA_HelpService_Provider::enum_instances(const NVRHBA_HelpService*,
                                                                  const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    enumeratePlain(agent, agent.m_NVRHBA_HelpService_map, handler);
    NVR_LOG("NVRHBA_HelpService_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

Invoke_Method_Status NVRHBA_HelpService_Provider::GetHelp(const NVRHBA_HelpService* self,
                                                          Property<String>& RequestedDocument, Property<uint16>& Format,
                                                          Property<uint16>& RequestedDelivery,
                                                          Property<String>& DocumentInfo,
                                                          Property<uint32>& return_value)
{
    NVR_LOG("NVRHBA_HelpService_Provider::GetHelp");
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    set(return_value, help(agent, self, RequestedDocument, Format, RequestedDelivery, DocumentInfo));
    return INVOKE_METHOD_OK;
}

} // namespace cimple
