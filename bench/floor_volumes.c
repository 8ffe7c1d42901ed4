/* The floor of an enumeration of volumes: a provider written by hand in C, which returns N of them with the properties that
 * the module's have, straight from static data, through the same CMPI calls on the same broker. Without cache, locks, life. */
#include <cmpidt.h>
#include <cmpift.h>
#include <cmpimacs.h>
#include <stdio.h>

static const CMPIBroker* broker;
static unsigned volumes = 16;

/* How many volumes there are from now on. */
__attribute__((visibility("default"))) void floor_volumes(unsigned count) { volumes = count; }

typedef struct {
    const char* name;
    CMPIType type;
    unsigned long long number;
    const char* text;   /* null: the volume's DeviceID */
    const char* second; /* of an array of texts */
} Row;

static const Row rows[] = {
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

static CMPIObjectPath* path_of(const char* name_space, const char* id)
{
    CMPIObjectPath* path = CMNewObjectPath(broker, name_space, "NVRHBA_StorageVolume", NULL);
    CMAddKey(path, "SystemCreationClassName", "CIM_ComputerSystem", CMPI_chars);
    CMAddKey(path, "SystemName", "host", CMPI_chars);
    CMAddKey(path, "CreationClassName", "NVRHBA_StorageVolume", CMPI_chars);
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

static CMPIInstance* volume_of(const CMPIObjectPath* path, const char* id)
{
    CMPIInstance* instance = CMNewInstance(broker, path, NULL);
    for (size_t i = 0; i < sizeof rows / sizeof rows[0]; i++) {
        const Row* row = &rows[i];
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

static void return_all(const CMPIResult* result, const CMPIObjectPath* op, int names_only)
{
    CMPIString* given = CMGetNameSpace(op, NULL);
    const char* name_space = CMGetCharsPtr(given, NULL);
    for (unsigned i = 0; i < volumes; i++) {
        char id[96];
        snprintf(id, sizeof id, "10000000C9A00001_50060E8005A10000_600C9A0F05A1FF00000000000000%04X_%016X", i & 0xFFFFu, i);
        CMPIObjectPath* path = path_of(name_space, id);
        if (names_only) {
            CMReturnObjectPath(result, path);
        } else {
            CMPIInstance* instance = volume_of(path, id);
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
NVRHBA_StorageVolume_Provider_Create_InstanceMI(const CMPIBroker* given, const CMPIContext* context, CMPIStatus* status)
{
    (void)context;
    static CMPIInstanceMI mi;
    broker = given;
    mi.hdl = NULL;
    mi.ft = &table;
    if (status) status->rc = CMPI_RC_OK;
    return &mi;
}
