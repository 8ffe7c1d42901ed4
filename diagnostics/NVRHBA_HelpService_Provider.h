/// Serves the help services of the diagnostic tests from the agent's map, and the text about each test.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_HelpService.h"
#include "classes/NVRHBA_HelpService_Methods.h"

namespace cimple {

class NVRHBA_HelpService_Provider : public Read_Only_Provider<NVRHBA_HelpService>, public NVRHBA_HelpService_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_HelpService* model, const Enum_Handler& handler);

    /// Return value 0 with the text; 4 for a document that the service does not have; 5 for an instance that is not
    /// served, a null argument, or a format or delivery other than 1.
    Invoke_Method_Status GetHelp(const NVRHBA_HelpService* self, Property<String>& RequestedDocument,
                                 Property<uint16>& Format, Property<uint16>& RequestedDelivery,
                                 Property<String>& DocumentInfo, Property<uint32>& return_value);
};

} // namespace cimple
