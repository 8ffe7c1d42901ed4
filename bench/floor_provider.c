/* The floor that the module is measured against: a provider written by hand in C, which returns N instances with the
 * properties that the module's have, straight from static data, through the same CMPI calls on the same broker. It has
 * no cache, no locks and no life. */
#include <cmpidt.h>
#include <cmpift.h>
#include <cmpimacs.h>
#include <stdio.h>

static const CMPIBroker* broker;
static unsigned instances = 4;

/* How many there are of each class from now on. */
__attribute__((visibility("default"))) void floor_instances(unsigned count)
{
    instances = count;
}

typedef struct {
    const char* name;
    CMPIType type;
    unsigned long long number;
    const char* text;   /* null: the DeviceID */
    const char* second; /* of an array of texts */
} Row;

static const Row port_rows[] = {
    {"InstanceID", CMPI_chars, 0, "NVRHBA", NULL},
    {"Caption", CMPI_chars, 0, "FC port", NULL},
    {"Description", CMPI_chars, 0, "Norvane 32Gb dual-port Fibre Channel adapter", NULL},
    {"ElementName", CMPI_chars, 0, "Norvane NV-32 FV2.01a4 DV12.4.2", NULL},
    {"Name", CMPI_chars, 0, NULL, NULL},
    {"Status", CMPI_chars, 0, "OK", NULL},
    {"HealthState", CMPI_uint16, 5, NULL, NULL},
    {"CommunicationStatus", CMPI_uint16, 2, NULL, NULL},
    {"DetailedStatus", CMPI_uint16, 1, NULL, NULL},
    {"OperatingStatus", CMPI_uint16, 16, NULL, NULL},
    {"PrimaryStatus", CMPI_uint16, 1, NULL, NULL},
    {"EnabledState", CMPI_uint16, 5, NULL, NULL},
    {"OtherEnabledState", CMPI_chars, 0, "", NULL},
    {"RequestedState", CMPI_uint16, 12, NULL, NULL},
    {"EnabledDefault", CMPI_uint16, 2, NULL, NULL},
    {"SystemCreationClassName", CMPI_chars, 0, "CIM_ComputerSystem", NULL},
    {"SystemName", CMPI_chars, 0, "host", NULL},
    {"CreationClassName", CMPI_chars, 0, "NVRHBA_FCPort", NULL},
    {"DeviceID", CMPI_chars, 0, NULL, NULL},
    {"PowerManagementSupported", CMPI_boolean, 0, NULL, NULL},
    {"Availability", CMPI_uint16, 3, NULL, NULL},
    {"StatusInfo", CMPI_uint16, 3, NULL, NULL},
    {"PowerOnHours", CMPI_uint64, 4711, NULL, NULL},
    {"TotalPowerOnHours", CMPI_uint64, 4711, NULL, NULL},
    {"Speed", CMPI_uint64, 16000000000ull, NULL, NULL},
    {"MaxSpeed", CMPI_uint64, 16000000000ull, NULL, NULL},
    {"RequestedSpeed", CMPI_uint64, 0, NULL, NULL},
    {"UsageRestriction", CMPI_uint16, 4, NULL, NULL},
    {"PortType", CMPI_uint16, 10, NULL, NULL},
    {"PortNumber", CMPI_uint16, 0, NULL, NULL},
    {"LinkTechnology", CMPI_uint16, 4, NULL, NULL},
    {"PermanentAddress", CMPI_chars, 0, NULL, NULL},
    {"SupportedMaximumTransmissionUnit", CMPI_uint64, 2112, NULL, NULL},
    {"ActiveMaximumTransmissionUnit", CMPI_uint64, 2112, NULL, NULL},
    {"LocationIndicator", CMPI_uint16, 2, NULL, NULL},
    {"FabricName", CMPI_chars, 0, "1000000533A00001", NULL},
    {"OperationalFirmware", CMPI_chars, 0, "SLI-3 Overlay:v2.01a4", NULL},
    {"FCID", CMPI_uint32, 0x10100, NULL, NULL},
    {"NumberOfDiscoveredPorts", CMPI_uint32, 9, NULL, NULL},
    {"AdapterName", CMPI_chars, 0, "Norvane-NV32-0", NULL},
};

static const Row volume_rows[] = {
    {"Description", CMPI_chars, 0, "NORVANE  VIRTUAL-DISK     Revision 0401 Serial Number 05A1FF000000", NULL},
    {"ElementName", CMPI_chars, 0, "Storage Volume: 0", NULL},
    {"Name", CMPI_chars, 0, "0C9A0F05A1FF000000000000000000", NULL},
    {"OperationalStatus", CMPI_uint16A, 0, NULL, NULL},
    {"EnabledState", CMPI_uint16, 5, NULL, NULL},
    {"RequestedState", CMPI_uint16, 12, NULL, NULL},
    {"EnabledDefault", CMPI_uint16, 2, NULL, NULL},
    {"TransitioningToState", CMPI_uint16, 12, NULL, NULL},
    {"SystemCreationClassName", CMPI_chars, 0, "CIM_ComputerSystem", NULL},
    {"SystemName", CMPI_chars, 0, "host", NULL},
    {"CreationClassName", CMPI_chars, 0, "NVRHBA_StorageVolume", NULL},
    {"DeviceID", CMPI_chars, 0, NULL, NULL},
    {"OtherIdentifyingInfo", CMPI_stringA, 0, "/dev/sda", "NORVANE  VIRTUAL-DISK     Revision 0401"},
    {"IdentifyingDescriptions", CMPI_stringA, 0, "OS Device Name", "Standard SCSI inquiry data"},
    {"BlockSize", CMPI_uint64, 512, NULL, NULL},
    {"NumberOfBlocks", CMPI_uint64, 16777215, NULL, NULL},
    {"Primordial", CMPI_boolean, 0, NULL, NULL},
    {"NameFormat", CMPI_uint16, 9, NULL, NULL},
    {"NameNamespace", CMPI_uint16, 2, NULL, NULL},
    {"IsComposite", CMPI_boolean, 1, NULL, NULL},
    {"CompressionRate", CMPI_uint16, 1, NULL, NULL},
    {"CanDelete", CMPI_boolean, 1, NULL, NULL},
    {"ThinlyProvisioned", CMPI_boolean, 0, NULL, NULL},
    {"StorageTieringSelection", CMPI_uint16, 0, NULL, NULL},
    {"Capacity", CMPI_uint64, 8589934080ull, NULL, NULL},
    {"CapacityUnit", CMPI_chars, 0, "Byte", NULL},
    {"DeviceType", CMPI_uint32, 0, NULL, NULL},
};

typedef struct {
    const char* name;
    const Row* rows;
    unsigned row_count;
    void (*name_device)(char id[96], unsigned index);
} Class;

static void name_port(char id[96], unsigned index)
{
    snprintf(id, 96, "10000000C9%06X", index & 0xFFFFFFu);
}

static void name_volume(char id[96], unsigned index)
{
    snprintf(id, 96, "10000000C9A00001_50060E8005A10000_600C9A0F05A1FF00000000000000%04X_%016X", index & 0xFFFFu,
             index);
}

#define COUNT(rows) (sizeof rows / sizeof rows[0])
static const Class port = {"NVRHBA_FCPort", port_rows, COUNT(port_rows), name_port};
static const Class volume = {"NVRHBA_StorageVolume", volume_rows, COUNT(volume_rows), name_volume};

static CMPIObjectPath* path_of(const char* name_space, const Class* class, const char* id)
{
    CMPIObjectPath* path = CMNewObjectPath(broker, name_space, class->name, NULL);
    CMAddKey(path, "SystemCreationClassName", "CIM_ComputerSystem", CMPI_chars);
    CMAddKey(path, "SystemName", "host", CMPI_chars);
    CMAddKey(path, "CreationClassName", class->name, CMPI_chars);
    CMAddKey(path, "DeviceID", id, CMPI_chars);
    return path;
}

static void set_array(CMPIInstance* instance, const Row* row)
{
    CMPIType element = row->type & ~CMPI_ARRAY;
    CMPIArray* array = CMNewArray(broker, element == CMPI_string ? 2 : 1, element, NULL);
    if (element == CMPI_string) {
        CMPIString* texts[2] = {CMNewString(broker, row->text, NULL), CMNewString(broker, row->second, NULL)};
        for (CMPICount i = 0; i < 2; i++)
            CMSetArrayElementAt(array, i, (CMPIValue*)&texts[i], CMPI_string);
    } else {
        CMPIValue value = {.uint64 = row->number};
        CMSetArrayElementAt(array, 0, &value, element);
    }
    CMSetProperty(instance, row->name, (CMPIValue*)&array, row->type);
    CMRelease(array);
}

static CMPIInstance* instance_of(const CMPIObjectPath* path, const Class* class, const char* id)
{
    CMPIInstance* instance = CMNewInstance(broker, path, NULL);
    for (const Row* row = class->rows; row < class->rows + class->row_count; row++) {
        if (row->type & CMPI_ARRAY) {
            set_array(instance, row);
        } else if (row->type == CMPI_chars) {
            CMSetProperty(instance, row->name, row->text ? row->text : id, CMPI_chars);
        } else {
            CMPIValue value = {.uint64 = row->number}; /* little-endian: narrower members read the same */
            CMSetProperty(instance, row->name, &value, row->type);
        }
    }
    return instance;
}

static void return_all(const CMPIInstanceMI* mi, const CMPIResult* result, const CMPIObjectPath* op, int names_only)
{
    const Class* class = mi->hdl;
    CMPIString* given = CMGetNameSpace(op, NULL);
    const char* name_space = CMGetCharsPtr(given, NULL);
    for (unsigned i = 0; i < instances; i++) {
        char id[96];
        class->name_device(id, i);
        CMPIObjectPath* path = path_of(name_space, class, id);
        if (names_only) {
            CMReturnObjectPath(result, path);
        } else {
            CMPIInstance* instance = instance_of(path, class, id);
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
    (void)context;
    return_all(mi, result, op, 1);
    CMReturn(CMPI_RC_OK);
}

static CMPIStatus enumerate(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                            const CMPIObjectPath* op, const char** properties)
{
    (void)context, (void)properties;
    return_all(mi, result, op, 0);
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

static CMPIInstanceMI* make(CMPIInstanceMI* mi, const Class* class, const CMPIBroker* given, CMPIStatus* status)
{
    broker = given;
    mi->hdl = (void*)class;
    mi->ft = &table;
    if (status) status->rc = CMPI_RC_OK;
    return mi;
}

__attribute__((visibility("default"))) CMPIInstanceMI*
NVRHBA_FCPort_Provider_Create_InstanceMI(const CMPIBroker* given, const CMPIContext* context, CMPIStatus* status)
{
    (void)context;
    static CMPIInstanceMI mi;
    return make(&mi, &port, given, status);
}

__attribute__((visibility("default"))) CMPIInstanceMI*
NVRHBA_StorageVolume_Provider_Create_InstanceMI(const CMPIBroker* given, const CMPIContext* context, CMPIStatus* status)
{
    (void)context;
    static CMPIInstanceMI mi;
    return make(&mi, &volume, given, status);
}
