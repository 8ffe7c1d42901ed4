/// The words of a port event, and the indication that tells of it.
#pragma once

#include "agent/ProviderAgent.h"
#include "classes/NVRHBA_AlertIndication.h"
#include "foundation/management_api.h"
#include "runtime/Instance.h"

namespace cimple {

/// How one type of event is told.
struct Port_Event {
    const char* log_text;
    const char* description; ///< format, with the port's name
    uint16 probable_cause;
    const char* cause_description;
    const char* message; ///< null: none
};

/// Known for HBA_EVENT_PORT_OFFLINE and HBA_EVENT_PORT_ONLINE; all others share one.
const Port_Event& port_event(uint32 eventType);

/// The indication of an event at a port that the agent publishes, with the next number of the agent's sequence; null,
/// logged, for another port. Waits for the adapter maps and holds their mutex; one caller at a time.
Ref<NVRHBA_AlertIndication> makeAlert(ProviderAgent& agent, HBA_WWN portWWN, uint32 eventType);

} // namespace cimple
