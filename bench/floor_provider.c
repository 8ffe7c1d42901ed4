/* The floor that the module is measured against: a provider written by hand in C, which returns N ports of 40 properties
 * straight from static data, through the same CMPI calls on the same broker. It has no cache, no locks and no life. */
#include <cmpidt.h>
#include <cmpift.h>
#include <cmpimacs.h>
#include <stdio.h>
#include <stdlib.h>

static const CMPIBroker* broker;
static unsigned ports = 4;

/* How many ports there are from now on. */
__attribute__((visibility("default"))) void floor_ports(unsigned count) { ports = count; }

typedef struct {
    const char* name;
    CMPIType type;
    unsigned long long number;
    const char* text; /* null: the port's WWPN */
} Row;

static const Row rows[] = {
    {"InstanceID", CMPI_chars, 0, "NVRHBA"},
    {"Caption", CMPI_chars, 0, "FC port"},
    {"Description", CMPI_chars, 0, "Norvane 32Gb dual-port Fibre Channel adapter"},
    {"ElementName", CMPI_chars, 0, "Norvane NV-32 FV2.01a4 DV12.4.2"},
    {"Name", CMPI_chars, 0, NULL},
    {"Status", CMPI_chars, 0, "OK"},
    {"HealthState", CMPI_uint16, 5, NULL},
    {"CommunicationStatus", CMPI_uint16, 2, NULL},
    {"DetailedStatus", CMPI_uint16, 1, NULL},
    {"OperatingStatus", CMPI_uint16, 16, NULL},
    {"PrimaryStatus", CMPI_uint16, 1, NULL},
    {"EnabledState", CMPI_uint16, 5, NULL},
    {"OtherEnabledState", CMPI_chars, 0, ""},
    {"RequestedState", CMPI_uint16, 12, NULL},
    {"EnabledDefault", CMPI_uint16, 2, NULL},
    {"SystemCreationClassName", CMPI_chars, 0, "CIM_ComputerSystem"},
    {"SystemName", CMPI_chars, 0, "host"},
    {"CreationClassName", CMPI_chars, 0, "NVRHBA_FCPort"},
    {"DeviceID", CMPI_chars, 0, NULL},
    {"PowerManagementSupported", CMPI_boolean, 0, NULL},
    {"Availability", CMPI_uint16, 3, NULL},
    {"StatusInfo", CMPI_uint16, 3, NULL},
    {"PowerOnHours", CMPI_uint64, 4711, NULL},
    {"TotalPowerOnHours", CMPI_uint64, 4711, NULL},
    {"Speed", CMPI_uint64, 16000000000ull, NULL},
    {"MaxSpeed", CMPI_uint64, 16000000000ull, NULL},
    {"RequestedSpeed", CMPI_uint64, 0, NULL},
    {"UsageRestriction", CMPI_uint16, 4, NULL},
    {"PortType", CMPI_uint16, 10, NULL},
    {"PortNumber", CMPI_uint16, 0, NULL},
    {"LinkTechnology", CMPI_uint16, 4, NULL},
    {"PermanentAddress", CMPI_chars, 0, NULL},
    {"SupportedMaximumTransmissionUnit", CMPI_uint64, 2112, NULL},
    {"ActiveMaximumTransmissionUnit", CMPI_uint64, 2112, NULL},
    {"LocationIndicator", CMPI_uint16, 2, NULL},
    {"FabricName", CMPI_chars, 0, "1000000533A00001"},
    {"OperationalFirmware", CMPI_chars, 0, "SLI-3 Overlay:v2.01a4"},
    {"FCID", CMPI_uint32, 0x10100, NULL},
    {"NumberOfDiscoveredPorts", CMPI_uint32, 9, NULL},
    {"AdapterName", CMPI_chars, 0, "Norvane-NV32-0"},
};

static CMPIObjectPath* path_of(const char* name_space, const char* wwpn)
{
    CMPIObjectPath* path = CMNewObjectPath(broker, name_space, "NVRHBA_FCPort", NULL);
    CMAddKey(path, "SystemCreationClassName", "CIM_ComputerSystem", CMPI_chars);
    CMAddKey(path, "SystemName", "host", CMPI_chars);
    CMAddKey(path, "CreationClassName", "NVRHBA_FCPort", CMPI_chars);
    CMAddKey(path, "DeviceID", wwpn, CMPI_chars);
    return path;
}

static void return_all(const CMPIResult* result, const CMPIObjectPath* op, int names_only)
{
    CMPIString* given = CMGetNameSpace(op, NULL);
    const char* name_space = CMGetCharsPtr(given, NULL);
    for (unsigned port = 0; port < ports; port++) {
        char wwpn[17];
        snprintf(wwpn, sizeof wwpn, "10000000C9%06X", port & 0xFFFFFFu);
        CMPIObjectPath* path = path_of(name_space, wwpn);
        if (names_only) {
            CMReturnObjectPath(result, path);
        } else {
            CMPIInstance* instance = CMNewInstance(broker, path, NULL);
            for (size_t i = 0; i < sizeof rows / sizeof rows[0]; i++) {
                if (rows[i].type == CMPI_chars) {
                    CMSetProperty(instance, rows[i].name, rows[i].text ? rows[i].text : wwpn, CMPI_chars);
                } else {
                    CMPIValue value = {.uint64 = rows[i].number}; /* little-endian: narrower members read the same */
                    CMSetProperty(instance, rows[i].name, &value, rows[i].type);
                }
            }
            CMReturnInstance(result, instance);
            CMRelease(instance);
        }
        CMRelease(path);
    }
    CMReturnDone(result);
}

static CMPIStatus cleanup(CMPIInstanceMI* mi, const CMPIContext* context, CMPIBoolean terminating)
{
    (void)mi, (void)context, (void)terminating;
    CMReturn(CMPI_RC_OK);
}

static CMPIStatus enumerate_names(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                                  const CMPIObjectPath* op)
{
    (void)mi, (void)context;
    return_all(result, op, 1);
    CMReturn(CMPI_RC_OK);
}

static CMPIStatus enumerate(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                            const CMPIObjectPath* op, const char** properties)
{
    (void)mi, (void)context, (void)properties;
    return_all(result, op, 0);
    CMReturn(CMPI_RC_OK);
}

static CMPIInstanceMIFT table = {
    .ftVersion = 100,
    .miVersion = 100,
    .miName = "floor",
    .cleanup = cleanup,
    .enumerateInstanceNames = enumerate_names,
    .enumerateInstances = enumerate,
};

__attribute__((visibility("default"))) CMPIInstanceMI*
NVRHBA_FCPort_Provider_Create_InstanceMI(const CMPIBroker* given, const CMPIContext* context, CMPIStatus* status)
{
    (void)context;
    static CMPIInstanceMI mi;
    broker = given;
    mi.hdl = NULL;
    mi.ft = &table;
    if (status) status->rc = CMPI_RC_OK;
    return &mi;
}
