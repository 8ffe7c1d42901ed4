/// The fakes of the providers that are no family members, with the methods that their classes declare.
#pragma once

#include "classes/NVRHBA_AlertIndication.h"
#include "classes/NVRHBA_BootBIOSService.h"
#include "classes/NVRHBA_BootBIOSService_Methods.h"
#include "classes/NVRHBA_DiagnosticsLog.h"
#include "classes/NVRHBA_DiagnosticsLog_Methods.h"
#include "classes/NVRHBA_DriverParamGlobal.h"
#include "classes/NVRHBA_DriverParams.h"
#include "classes/NVRHBA_DriverRecordLogManagesRecord.h"
#include "classes/NVRHBA_DumpData.h"
#include "classes/NVRHBA_DumpService.h"
#include "classes/NVRHBA_DumpService_Methods.h"
#include "classes/NVRHBA_FCDriverLogEntry.h"
#include "classes/NVRHBA_FCHBADiagnosticTest.h"
#include "classes/NVRHBA_FCHBADiagnosticTest_Methods.h"
#include "classes/NVRHBA_FCHBADriverParamService.h"
#include "classes/NVRHBA_FCHBADriverParamService_Methods.h"
#include "classes/NVRHBA_FCHBAWWNService.h"
#include "classes/NVRHBA_FCHBAWWNService_Methods.h"
#include "classes/NVRHBA_FCPort.h"
#include "classes/NVRHBA_FCPortStatistics.h"
#include "classes/NVRHBA_FCPortStatistics_Methods.h"
#include "classes/NVRHBA_FCPort_Methods.h"
#include "classes/NVRHBA_FCTagService.h"
#include "classes/NVRHBA_FCTagService_Methods.h"
#include "classes/NVRHBA_HelpService.h"
#include "classes/NVRHBA_HelpService_Methods.h"
#include "classes/NVRHBA_LogEntry.h"
#include "classes/NVRHBA_ProviderConfigSetting.h"
#include "classes/NVRHBA_RecordLog.h"
#include "classes/NVRHBA_RecordLogManagesRecord.h"
#include "classes/NVRHBA_RecordLog_Methods.h"
#include "classes/NVRHBA_RegisteredProfile.h"
#include "classes/NVRHBA_RegisteredProfile_Methods.h"
#include "classes/NVRHBA_SoftwareInstallationService.h"
#include "classes/NVRHBA_SoftwareInstallationService_Methods.h"
#include "tests/classes/fake/Fake_Provider.h"

namespace cimple {

class NVRHBA_AlertIndication_Provider : public fake::Provider<NVRHBA_AlertIndication> {};
class NVRHBA_DriverParamGlobal_Provider : public fake::Provider<NVRHBA_DriverParamGlobal> {};
class NVRHBA_DriverParams_Provider : public fake::Provider<NVRHBA_DriverParams> {};
class NVRHBA_DriverRecordLogManagesRecord_Provider : public fake::Provider<NVRHBA_DriverRecordLogManagesRecord> {};
class NVRHBA_DumpData_Provider : public fake::Provider<NVRHBA_DumpData> {};
class NVRHBA_FCDriverLogEntry_Provider : public fake::Provider<NVRHBA_FCDriverLogEntry> {};
class NVRHBA_LogEntry_Provider : public fake::Provider<NVRHBA_LogEntry> {};
class NVRHBA_ProviderConfigSetting_Provider : public fake::Provider<NVRHBA_ProviderConfigSetting> {};
class NVRHBA_RecordLogManagesRecord_Provider : public fake::Provider<NVRHBA_RecordLogManagesRecord> {};

class NVRHBA_DiagnosticsLog_Provider : public fake::Provider<NVRHBA_DiagnosticsLog>,
                                       public NVRHBA_DiagnosticsLog_Methods {};
class NVRHBA_FCHBADiagnosticTest_Provider : public fake::Provider<NVRHBA_FCHBADiagnosticTest>,
                                            public NVRHBA_FCHBADiagnosticTest_Methods {};
class NVRHBA_FCPort_Provider : public fake::Provider<NVRHBA_FCPort>, public NVRHBA_FCPort_Methods {};
class NVRHBA_FCPortStatistics_Provider : public fake::Provider<NVRHBA_FCPortStatistics>,
                                         public NVRHBA_FCPortStatistics_Methods {};
class NVRHBA_HelpService_Provider : public fake::Provider<NVRHBA_HelpService>, public NVRHBA_HelpService_Methods {};
class NVRHBA_RegisteredProfile_Provider : public fake::Provider<NVRHBA_RegisteredProfile>,
                                          public NVRHBA_RegisteredProfile_Methods {};

class NVRHBA_BootBIOSService_Provider : public fake::Provider<NVRHBA_BootBIOSService>,
                                        public NVRHBA_BootBIOSService_Methods {
public:
    using Self = const NVRHBA_BootBIOSService*;
    using Port = NVRHBA_FCPort*&;
    using Result = Property<uint32>&;
    int StartService(Self, Result result) { return serve("StartService", result); }
    int EnableBootBIOS(Self, Port, Result result) { return serve("EnableBootBIOS", result); }
    int DisableBootBIOS(Self, Port, Result result) { return serve("DisableBootBIOS", result); }
    int GetBootBIOSStatus(Self, Port, Property<uint32>& status, Result result)
    {
        status.set(7u);
        return serve("GetBootBIOSStatus", result);
    }
};

class NVRHBA_DumpService_Provider : public fake::Provider<NVRHBA_DumpService>, public NVRHBA_DumpService_Methods {
public:
    using Self = const NVRHBA_DumpService*;
    using Port = NVRHBA_FCPort*&;
    using Result = Property<uint32>&;
    int GenerateDump(Self, Port, Result result) { return serve("GenerateDump", result); }
    int GetDumpFileNames(Self, Port, Property<Array<String>>& files, Result result)
    {
        files.value.append(String("dump.1"));
        files.null = 0;
        return serve("GetDumpFileNames", result);
    }
    int DeleteDump(Self, Port, Result result) { return serve("DeleteDump", result); }
};

class NVRHBA_FCHBADriverParamService_Provider : public fake::Provider<NVRHBA_FCHBADriverParamService>,
                                                public NVRHBA_FCHBADriverParamService_Methods {
public:
    using Self = const NVRHBA_FCHBADriverParamService*;
    int StartService(Self, Property<uint32>& result) { return serve("StartService", result); }
    int SetDriverParameter(Self, NVRHBA_FCPort*&, const Property<boolean>& permanent, const Property<boolean>& global,
                           const Property<String>& name, const Property<String>& value, Property<uint32>& result)
    {
        note(std::string("SetDriverParameter ") + (permanent.value ? "permanent " : "") +
             (global.value ? "global " : "") + name.value.c_str() + "=" + value.value.c_str());
        result.set(40000u);
        return 0;
    }
};

class NVRHBA_FCHBAWWNService_Provider : public fake::Provider<NVRHBA_FCHBAWWNService>,
                                        public NVRHBA_FCHBAWWNService_Methods {
public:
    template <class... Parameters>
    int ChangeWWN(const NVRHBA_FCHBAWWNService*, NVRHBA_FCPort*&, Parameters&&...)
    {
        note("ChangeWWN");
        return INVOKE_METHOD_FAILED;
    }
    template <class... Parameters>
    int RestoreWWN(Parameters&&...)
    {
        note("RestoreWWN");
        return 0;
    }
    template <class... Parameters>
    int ReadWWN(Parameters&&...)
    {
        note("ReadWWN");
        return 0;
    }
    int GetWWNCapability(const NVRHBA_FCHBAWWNService*, NVRHBA_FCPort*&, Property<uint32>&, Property<uint32>& result)
    {
        return serve("GetWWNCapability", result);
    }
};

class NVRHBA_FCTagService_Provider : public fake::Provider<NVRHBA_FCTagService>, public NVRHBA_FCTagService_Methods {
public:
    using Self = const NVRHBA_FCTagService*;
    using Port = NVRHBA_FCPort*&;
    using Result = Property<uint32>&;
    int SetConfigTable(Self, Port, Property<String>&, Result result) { return serve("SetConfigTable", result); }
    int GetConfigTable(Self, Port, Property<String>&, Result result) { return serve("GetConfigTable", result); }
    int SetGlobalFlag(Self, Port, Property<uint32>&, Result result) { return serve("SetGlobalFlag", result); }
    int GetGlobalFlag(Self, Port, Property<uint32>&, Result result) { return serve("GetGlobalFlag", result); }
};

class NVRHBA_RecordLog_Provider : public fake::Provider<NVRHBA_RecordLog>, public NVRHBA_RecordLog_Methods {
public:
    using Self = const NVRHBA_RecordLog*;
    int ClearLog(Self, Property<uint32>& result) { return serve("ClearLog", result); }
    int SetLogParams(Self, Property<uint16>&, Property<uint16>&, Property<String>&, Property<uint32>& result)
    {
        return serve("SetLogParams", result);
    }
};

class NVRHBA_SoftwareInstallationService_Provider : public fake::Provider<NVRHBA_SoftwareInstallationService>,
                                                    public NVRHBA_SoftwareInstallationService_Methods {
public:
    using Self = const NVRHBA_SoftwareInstallationService*;
    int StartService(Self, Property<uint32>& result) { return serve("StartService", result); }
    int InstallFromURI(Self, CIM_ConcreteJob*&, Property<String>&, CIM_ManagedElement*&, Property<Array<uint16>>&,
                       Property<Array<String>>&, Property<uint32>& result)
    {
        return serve("InstallFromURI", result);
    }
    int ResetHBA(Self, NVRHBA_FCPort*&, Property<uint32>& result) { return serve("ResetHBA", result); }
    int SetPortEnabled(Self, NVRHBA_FCPort*&, Property<boolean>&, Property<uint32>& result)
    {
        return serve("SetPortEnabled", result);
    }
};

} // namespace cimple
