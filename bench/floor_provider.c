/* The floor that the module is measured against: a provider written by hand in C, which returns N instances with the
 * properties that the module's have, of the same types and lengths, straight from static data, through the same CMPI
 * calls on the same broker. It has no cache, no locks and no life. */
#include <cmpidt.h>
#include <cmpift.h>
#include <cmpimacs.h>
#include <stdio.h>
#include <stdlib.h>

static const CMPIBroker* broker;
static unsigned instances;

typedef struct {
    const char* name;
    CMPIType type;
    unsigned long long number;
    const char* text;          /* null: the DeviceID */
    CMPICount size;            /* of an array */
    const char* const* texts;  /* its elements; a null one is the DeviceID */
    const CMPIUint16* numbers; /* or these */
} Row;

#define COUNT(rows) (sizeof rows / sizeof rows[0])
#define TEXTS(...)                                                                                                     \
    CMPI_stringA, .size = COUNT(((const char* const[]){__VA_ARGS__})), .texts = (const char* const[])                  \
    {                                                                                                                  \
        __VA_ARGS__                                                                                                    \
    }
#define NUMBERS(...)                                                                                                   \
    CMPI_uint16A, .size = COUNT(((const CMPIUint16[]){__VA_ARGS__})), .numbers = (const CMPIUint16[])                  \
    {                                                                                                                  \
        __VA_ARGS__                                                                                                    \
    }

static const Row port_rows[] = {
    {"Description", CMPI_chars, .text = "Norvane FC2162 16Gb Fibre Channel Host Bus Adapter"},
    {"ElementName", CMPI_chars, .text = "Norvane FC2162 FV2.01a4 DV8.3.7.18 HBA1"},
    {"Name", CMPI_chars, .text = NULL},
    {"OperationalStatus", NUMBERS(2)},
    {"StatusDescriptions", TEXTS("OK")},
    {"EnabledState", CMPI_uint16, .number = 5},
    {"RequestedState", CMPI_uint16, .number = 12},
    {"EnabledDefault", CMPI_uint16, .number = 2},
    {"TransitioningToState", CMPI_uint16, .number = 12},
    {"SystemCreationClassName", CMPI_chars, .text = "CIM_ComputerSystem"},
    {"SystemName", CMPI_chars, .text = "host"},
    {"CreationClassName", CMPI_chars, .text = "NVRHBA_FCPort"},
    {"DeviceID", CMPI_chars, .text = NULL},
    {"OtherIdentifyingInfo", TEXTS("Norvane FC2162 16Gb 2-Port PCIe Fibre Channel Adapter", "FC2162-M8", "NV216200001",
                                   "A-5681", "4E56", "FC2162", "Norvane FC2162 16Gb 2-Port PCIe Fibre Channel Adapter",
                                   "FC2162-M8", "1", "slot 1", "/sys/class/fc_host/host1", "00:00:c9:a0:00:02")},
    {"IdentifyingDescriptions",
     TEXTS("VPD:PRODUCT_NAME", "VPD:PART_NUMBER", "VPD:SERIAL_NUMBER", "VPD:EC_LEVEL", "VPD:MANUFACTURER_ID", "VPD:V0",
           "VPD:V1", "VPD:V2", "VPD:V4", "VPD:YA", "OS Device Name", "NORVANE:IEEE_ADDRESS")},
    {"Speed", CMPI_uint64, .number = 16000000000ull},
    {"MaxSpeed", CMPI_uint64, .number = 16000000000ull},
    {"UsageRestriction", CMPI_uint16, .number = 4},
    {"PortType", CMPI_uint16, .number = 10},
    {"PortNumber", CMPI_uint16, .number = 1},
    {"LinkTechnology", CMPI_uint16, .number = 4},
    {"PermanentAddress", CMPI_chars, .text = NULL},
    {"NetworkAddresses", TEXTS(NULL)},
    {"SupportedMaximumTransmissionUnit", CMPI_uint64, .number = 2048},
    {"ActiveMaximumTransmissionUnit", CMPI_uint64, .number = 2048},
    {"SupportedCOS", NUMBERS(3)},
    {"ActiveCOS", NUMBERS(3)},
    {"SupportedFC4Types", NUMBERS(8, 32)},
    {"ActiveFC4Types", NUMBERS(8)},
    {"PortAvailability", CMPI_uint16, .number = 2},
    {"LocationIndicator", CMPI_uint16, .number = 3},
    {"FabricName", CMPI_chars, .text = "1000000533A10001"},
    {"OperationalFirmware", CMPI_chars, .text = "SLI-3 Overlay:v2.01a4"},
    {"FCID", CMPI_uint32, .number = 0x20100},
    {"NumberOfDiscoveredPorts", CMPI_uint32, .number = 0},
    {"AdapterName", CMPI_chars, .text = "Norvane-FC2162-1"},
};

static const Row volume_rows[] = {
    {"Description", CMPI_chars, .text = "NORVANE  VIRTUAL-DISK     Revision 0401 Serial Number 05A1FF000000"},
    {"ElementName", CMPI_chars, .text = "Storage Volume: 0"},
    {"Name", CMPI_chars, .text = "0C9A0F05A1FF000000000000000000"},
    {"OperationalStatus", NUMBERS(0)},
    {"EnabledState", CMPI_uint16, .number = 5},
    {"RequestedState", CMPI_uint16, .number = 12},
    {"EnabledDefault", CMPI_uint16, .number = 2},
    {"TransitioningToState", CMPI_uint16, .number = 12},
    {"SystemCreationClassName", CMPI_chars, .text = "CIM_ComputerSystem"},
    {"SystemName", CMPI_chars, .text = "host"},
    {"CreationClassName", CMPI_chars, .text = "NVRHBA_StorageVolume"},
    {"DeviceID", CMPI_chars, .text = NULL},
    {"OtherIdentifyingInfo", TEXTS("/dev/sda", "NORVANE  VIRTUAL-DISK     Revision 0401")},
    {"IdentifyingDescriptions", TEXTS("OS Device Name", "Standard SCSI inquiry data")},
    {"BlockSize", CMPI_uint64, .number = 512},
    {"NumberOfBlocks", CMPI_uint64, .number = 16777215},
    {"Primordial", CMPI_boolean, .number = 0},
    {"NameFormat", CMPI_uint16, .number = 9},
    {"NameNamespace", CMPI_uint16, .number = 2},
    {"IsComposite", CMPI_boolean, .number = 1},
    {"CompressionRate", CMPI_uint16, .number = 1},
    {"CanDelete", CMPI_boolean, .number = 1},
    {"ThinlyProvisioned", CMPI_boolean, .number = 0},
    {"StorageTieringSelection", CMPI_uint16, .number = 0},
    {"Capacity", CMPI_uint64, .number = 8589934080ull},
    {"CapacityUnit", CMPI_chars, .text = "Byte"},
    {"DeviceType", CMPI_uint16, .number = 0},
};

typedef struct {
    const char* name;
    const Row* rows;
    unsigned row_count;
    unsigned id_size; /* of a DeviceID, with its end */
    char* ids;        /* one behind the other */
} Class;

static Class port = {"NVRHBA_FCPort", port_rows, COUNT(port_rows), 17, NULL};
static Class volume = {"NVRHBA_StorageVolume", volume_rows, COUNT(volume_rows), 84, NULL};

static const char* id_of(const Class* class, unsigned index)
{
    return class->ids + (size_t)index * class->id_size;
}

__attribute__((destructor)) static void give_back_ids(void)
{
    free(port.ids);
    free(volume.ids);
    port.ids = volume.ids = NULL;
}

/* How many there are of each class from now on (none before): their names are made here, so that a request finds ready
 * texts. None too where there is no memory for them. While no request runs. */
__attribute__((visibility("default"))) void floor_instances(unsigned count)
{
    give_back_ids();
    port.ids = calloc(count, port.id_size);
    volume.ids = calloc(count, volume.id_size);
    instances = port.ids && volume.ids ? count : 0;
    for (unsigned i = 0; i < instances; i++) {
        snprintf((char*)id_of(&port, i), port.id_size, "10000000C9%06X", i & 0xFFFFFFu);
        snprintf((char*)id_of(&volume, i), volume.id_size,
                 "10000000C9A00001_50060E8005A10000_600C9A0F05A1FF00000000000000%04X_%016X", i & 0xFFFFu, i);
    }
}

/* What was made before a failure is the broker's to free with the call. */
#define TRY(call)                                                                                                      \
    do {                                                                                                               \
        const CMPIStatus tried = (call);                                                                               \
        if (tried.rc != CMPI_RC_OK) return tried;                                                                      \
    } while (0)

static CMPIStatus add_keys(CMPIObjectPath* path, const Class* class, const char* id)
{
    TRY(CMAddKey(path, "SystemCreationClassName", "CIM_ComputerSystem", CMPI_chars));
    TRY(CMAddKey(path, "SystemName", "host", CMPI_chars));
    TRY(CMAddKey(path, "CreationClassName", class->name, CMPI_chars));
    return CMAddKey(path, "DeviceID", id, CMPI_chars);
}

static CMPIStatus fill_array(CMPIArray* array, const Row* row, const char* id)
{
    for (CMPICount i = 0; i < row->size; i++) {
        if (row->numbers) {
            const CMPIValue value = {.uint16 = row->numbers[i]};
            TRY(CMSetArrayElementAt(array, i, &value, CMPI_uint16));
            continue;
        }
        CMPIStatus status = {CMPI_RC_OK, NULL};
        CMPIString* text = CMNewString(broker, row->texts[i] ? row->texts[i] : id, &status);
        if (!text) return status;
        TRY(CMSetArrayElementAt(array, i, (CMPIValue*)&text, CMPI_string));
        CMRelease(text);
    }
    CMReturn(CMPI_RC_OK);
}

static CMPIStatus set_array(CMPIInstance* instance, const Row* row, const char* id)
{
    CMPIStatus status = {CMPI_RC_OK, NULL};
    CMPIArray* array = CMNewArray(broker, row->size, row->type & ~CMPI_ARRAY, &status);
    if (!array) return status;
    TRY(fill_array(array, row, id));
    TRY(CMSetProperty(instance, row->name, (CMPIValue*)&array, row->type));
    return CMRelease(array);
}

static CMPIStatus set_properties(CMPIInstance* instance, const Class* class, const char* id)
{
    for (const Row* row = class->rows; row < class->rows + class->row_count; row++) {
        if (row->type & CMPI_ARRAY) {
            TRY(set_array(instance, row, id));
        } else if (row->type == CMPI_chars) {
            TRY(CMSetProperty(instance, row->name, row->text ? row->text : id, CMPI_chars));
        } else {
            const CMPIValue value = {.uint64 = row->number}; /* little-endian: narrower members read the same */
            TRY(CMSetProperty(instance, row->name, &value, row->type));
        }
    }
    CMReturn(CMPI_RC_OK);
}

static CMPIStatus return_instance(const CMPIResult* result, const CMPIObjectPath* path, const Class* class,
                                  const char* id)
{
    CMPIStatus status = {CMPI_RC_OK, NULL};
    CMPIInstance* instance = CMNewInstance(broker, path, &status);
    if (!instance) return status;
    TRY(set_properties(instance, class, id));
    TRY(CMReturnInstance(result, instance));
    return CMRelease(instance);
}

static CMPIStatus return_all(const CMPIInstanceMI* mi, const CMPIResult* result, const CMPIObjectPath* op,
                             int names_only)
{
    const Class* class = mi->hdl;
    CMPIStatus status = {CMPI_RC_OK, NULL};
    CMPIString* given = CMGetNameSpace(op, &status);
    if (!given) return status;
    const char* name_space = CMGetCharsPtr(given, NULL);
    for (unsigned i = 0; i < instances; i++) {
        const char* id = id_of(class, i);
        CMPIObjectPath* path = CMNewObjectPath(broker, name_space, class->name, &status);
        if (!path) return status;
        TRY(add_keys(path, class, id));
        TRY(names_only ? CMReturnObjectPath(result, path) : return_instance(result, path, class, id));
        TRY(CMRelease(path));
    }
    return CMReturnDone(result);
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
    return return_all(mi, result, op, 1);
}

static CMPIStatus enumerate(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                            const CMPIObjectPath* op, const char** properties)
{
    (void)context, (void)properties;
    return return_all(mi, result, op, 0);
}

static CMPIInstanceMIFT table = {
    .ftVersion = 100,
    .miVersion = 100,
    .miName = "floor",
    .cleanup = cleanup,
    .enumerateInstanceNames = enumerate_names,
    .enumerateInstances = enumerate,
};

static CMPIInstanceMI* make(CMPIInstanceMI* mi, Class* class, const CMPIBroker* given, CMPIStatus* status)
{
    broker = given;
    mi->hdl = class;
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
