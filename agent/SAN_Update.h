/// One run of updateSANMaps: every target behind every FC port becomes a remote endpoint, a logical unit, and what ties
/// them to the host and to the port's own endpoint.
///
/// Lives for the run, under m_SANMapsReadyMutex and m_DataMutex. Instances are the maps' own. The order of the steps is
/// the order of enumeration. A refused instance throws Update_Ended, which ends the run.
#pragma once

#include <initializer_list>
#include <string>
#include <unordered_map>

#include "agent/ProviderAgent.h"
#include "agent/Text_Pool.h"
#include "agent/instance_table.h"
#include "agent/lun_naming.h"
#include "runtime/String.h"

namespace cimple {

class Adapter;
class Port;
class Target;
struct NVRHBA_SCSIProtocolEndpoint;

class SAN_Update {
public:
    explicit SAN_Update(ProviderAgent& agent);

    /// Throws Update_Ended, and std::exception for an inventory that contradicts itself.
    void walkAdapters();

private:
    /// What the instances of one target are made from and tied to.
    struct Target_Scope {
        const Target& target;
        Instance* initiator;
        const char* wwpn; // of the initiator
        String lun;
        String inquiry;
        String shortInquiry;
        String identifier;
    };

    // updateSANMaps.cpp
    void buildPort(Port& port);

    // san_instances.cpp
    void buildTarget(Target_Scope& scope, int index);
    Ref<NVRHBA_SCSIProtocolEndpoint> makeEndpoint(Target_Scope& scope);
    Instance* buildUnit(const Target_Scope& scope, const Unit_Class_Row& row);

    // logical_unit_instances.cpp
    Ref<Instance> makeStorageVolume(const Target_Scope& scope, const Unit_Class_Row& row);
    Ref<Instance> makeTapeDrive(const Target_Scope& scope, const Unit_Class_Row& row);
    Ref<Instance> makeLogicalDisk(const Target_Scope& scope, const Unit_Class_Row& row);
    Ref<Instance> makeSCSIArbitraryLogicalUnit(const Target_Scope& scope, const Unit_Class_Row& row);
    Ref<Instance> makeStorageExtent(const Target_Scope& scope, const Unit_Class_Row& row);
    template <class T>
    Ref<T> makeUnit(const char* class_name, const Target_Scope& scope, const Unit_Class_Row& row);

    /// One association of a target.
    struct End {
        const char* reference;
        Instance* instance;
    };
    Instance* tie(Instance_Map& map, std::initializer_list<End> ends);

    ProviderAgent& m_agent;
    Text_Pool m_texts;
    const String m_nameSpace = m_texts(norvane_name_space);
    Instance* m_host = nullptr;
    String m_hostClass;
    String m_hostName;
    /// The ports' own endpoints by name, in small letters; of two with one name the first.
    std::unordered_map<std::string, Instance*> m_initiators;
};

} // namespace cimple
