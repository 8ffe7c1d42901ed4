#include "logs/alert_instance.h"

#include "agent/Agent_Wait.h"
#include "agent/instance_table.h"
#include "classes/CIM_ComputerSystem.h"
#include "classes/NVRHBA_FCPort.h"
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"

namespace cimple {

namespace {

/// The host's own instance, or null.
const Instance* host_of(const ProviderAgent& agent)
{
    const Instance_Map& hosts = agent.m_CIM_ComputerSystem_map;
    return hosts.empty() ? nullptr : hosts[0];
}

/// A clone of the map's port of that name, or null, logged.
Ref<Instance> findPort(const ProviderAgent& agent, const std::string& wwpn)
{
    const auto model = make<NVRHBA_FCPort>();
    const Instance* found = nullptr;
    if (const Instance* host = host_of(agent)) {
        set(model->SystemCreationClassName, string_property(host, "CreationClassName"));
        set(model->SystemName, string_property(host, "Name"));
        set(model->CreationClassName, "NVRHBA_FCPort");
        set(model->DeviceID, wwpn);
        found = agent.m_NVRHBA_FCPort_map.lookup(model.get());
    }
    if (!found) {
        NVR_LOG("Could not find the required FCPort");
        return Ref<Instance>();
    }
    return Ref<Instance>(clone(found));
}

void setAlertingElement(NVRHBA_AlertIndication& alert, const Instance* port)
{
    constexpr uint16 format_unknown = 0, format_object_path = 2;
    String path;
    const bool has_path = instance_to_model_path(port, path) == 0;
    set(alert.AlertingManagedElement, has_path ? path : String("NVRHBA_FCPort"));
    set(alert.AlertingElementFormat, has_path ? format_object_path : format_unknown);
}

/// All of the indication of an event on that port of the host's.
Ref<NVRHBA_AlertIndication> fillAlert(const ProviderAgent& agent, const Port_Event& event, const std::string& wwpn,
                                      const Instance* port)
{
    auto alert = make<NVRHBA_AlertIndication>();
    constexpr uint16 severity_information = 2, alert_other = 1, trending_unknown = 0;
    const uint32 sequence = agent.m_indicationSequence;
    const String number = text("%u", sequence);
    const Datetime now = Datetime::now();
    const Instance* host = host_of(agent);
    set(alert->IndicationIdentifier, number);
    set(alert->CorrelatedIndications, {});
    set(alert->IndicationTime, now);
    set(alert->PerceivedSeverity, severity_information);
    set(alert->SequenceNumber, sequence);
    set(alert->Description, text(event.description, wwpn.c_str()));
    setAlertingElement(*alert, port);
    set(alert->AlertType, alert_other);
    set(alert->OtherAlertType, "Link Status");
    set(alert->ProbableCause, event.probable_cause);
    set(alert->ProbableCauseDescription, event.cause_description);
    set(alert->Trending, trending_unknown);
    set(alert->EventID, number);
    set(alert->EventTime, now);
    set(alert->SystemCreationClassName, string_property(host, "CreationClassName"));
    set(alert->SystemName, string_property(host, "Name"));
    set(alert->ProviderName, "NVRHBA_AlertIndication_Provider");
    if (event.message) set(alert->Message, event.message);
    set(alert->MessageID, "Norvane");
    return alert;
}

} // namespace

const Port_Event& port_event(uint32 eventType)
{
    static constexpr Port_Event offline = {"Port Offline (LINK_DOWN)", "Port WWN %s status changed to LINK_DOWN.", 30,
                                           "Link Down", "PORT LINK DOWN"};
    static constexpr Port_Event online = {"Port Online (LINK_UP)", "Port WWN %s status changed to LINK_UP.", 1,
                                          "Link Up", "PORT LINK UP"};
    static constexpr Port_Event other = {"Unknown", "Port WWN %s status changed to unknown.", 0, "Unknown", nullptr};
    switch (eventType) {
    case HBA_EVENT_PORT_OFFLINE:
        return offline;
    case HBA_EVENT_PORT_ONLINE:
        return online;
    default:
        return other;
    }
}

Ref<NVRHBA_AlertIndication> makeAlert(ProviderAgent& agent, HBA_WWN portWWN, uint32 eventType)
{
    agent.BuildCimpleInfo();
    const Ready_Lock maps(agent.m_AdapterMapsReadyMutex, agent.m_bIsAdapterMapsReady, agent.m_AdapterMapsReadyCond,
                          "m_bIsAdapterMapsReady");
    NVR_LOG("Getting the Alerting Element");
    const std::string wwpn = wwnText(portWWN);
    const Ref<Instance> port = madeOrLog("Could not create FCPort instance", [&] { return findPort(agent, wwpn); });
    if (!port) return Ref<NVRHBA_AlertIndication>();
    NVR_LOG("Creating the NVRHBA AlertIndication");
    auto alert = madeOrLog("Could not create the required AlertIndication instance",
                           [&] { return fillAlert(agent, port_event(eventType), wwpn, port.get()); });
    if (!alert) return alert;
    NVR_LOG("Indication %u WWN = %s", agent.m_indicationSequence, wwpn.c_str());
    agent.m_indicationSequence++;
    return alert;
}

} // namespace cimple
