/* The management API: names, argument shapes, status codes and record layouts of the adapter maker's closed libraries.
 *
 * Shared by the binding, which resolves these operations by name at run time, and by the simulator, which answers to
 * the same names. Plain C: nothing here is linked against, and no symbol is declared, only types, constants and tables.
 *
 * Where the maker leaves a layout open, the layout below is the one that this project has laid down. Numbers are in the
 * host's byte order, World Wide Names and FCP LUNs are eight bytes in wire order, byte 0 first.
 *
 * READERS MUST TREAT THE LIBRARY AS HOSTILE. A count or length that comes back may be 0, huge, or larger than the
 * buffer that was given; a text may lack its terminator; a returned pointer may point anywhere; a walk may never end.
 * So:
 *   - zero a buffer before a call, and read only as far as the buffer that was given, whatever size came back;
 *   - read a text at most as far as its field;
 *   - use a pointer from `RM_GetAttributeValue` only if it and its length lie inside the block;
 *   - bound every walk by the capacities named here;
 *   - copy values out with memcpy: nothing here promises alignment inside a block. */
#ifndef _foundation_management_api_h
#define _foundation_management_api_h

#include <assert.h>
#include <stddef.h>
#include <stdint.h>
#include <time.h> /* hbaapi.h uses struct tm without including it */

#include <hbaapi.h>

#ifdef __cplusplus
extern "C" {
#endif

/* --------------------------------------------------------------------------------------------------- status codes */

/* Results of operations, beside the HBA_STATUS_* of hbaapi.h, whose numbers they share below 31. */
enum {
    RM_STATUS_OK = 0,
    RM_STATUS_ERROR = 1, /* also: library or symbol missing; callers cannot tell the two apart */
    RM_STATUS_NOT_SUPPORTED = 2,
    RM_STATUS_ARGUMENT = 4,
    RM_STATUS_ILLEGAL_WWN = 5,
    RM_STATUS_MORE_DATA = 7,  /* buffer too small; the count or size now holds the need */
    RM_STATUS_STALE_DATA = 8, /* answered by HBA_RefreshInformation and one more try */
    RM_STATUS_CHECK_CONDITION = 9,
    RM_STATUS_DIRECTORY_NOT_OPENED = 27,
    RM_STATUS_NO_RESULT_YET = 60,
    RM_STATUS_TOO_MANY_REQUESTS = 62,
    RM_STATUS_DIAGNOSTICS_NOT_AVAILABLE = 63,
    RM_STATUS_ADAPTER_BUSY = 64,
    RM_STATUS_WWN_NOT_SUPPORTED = 89,
    RM_STATUS_WWN_NOT_AVAILABLE = 92,
    RM_STATUS_WWN_BUSY = 97, /* ask again in a second */
    RM_STATUS_HOST_NOT_SUPPORTED = 128,
    RM_STATUS_MAILBOX_FAILED = 148,
    RM_STATUS_MAILBOX_TIMED_OUT = 149,
    RM_STATUS_MAILBOX_BUSY = 150,
    RM_STATUS_CONFIG_NOT_OPENED = 160,
    RM_STATUS_CONFIG_NOT_WRITTEN = 178,
    RM_STATUS_RESET_REFUSED = 190,
    RM_STATUS_LIST_TOO_LONG = 191, /* as MORE_DATA, for parameter and dump lists */
    RM_STATUS_BOOT_CODE_ENABLED = 221,
    RM_STATUS_REBOOT_NEEDED = 247 /* firmware written, active after a reboot */
};

/* Activation codes that RM_ChangeWWN and RM_RestoreWWN hand out; RM_SetPortEnabled uses the value 5 alone. */
enum {
    RM_ACTIVATION_ALREADY_ACTIVE = 1,
    RM_ACTIVATION_VOLATILE_REBOOT = 5,
    RM_ACTIVATION_NONVOLATILE_REBOOT = 6,
    RM_ACTIVATION_VOLATILE_RESET = 7,
    RM_ACTIVATION_NONVOLATILE_RESET = 8,
    RM_PORT_ACTIVATION_RESET = 5
};

/* Kinds of names: `type` of RM_ReadWWN (all), RM_ChangeWWN (0, 1). RM_RestoreWWN: 0 factory names, 1 non-volatile. */
enum { RM_WWN_VOLATILE = 0, RM_WWN_NONVOLATILE = 1, RM_WWN_FACTORY = 2, RM_WWN_CURRENT = 3, RM_WWN_CONFIGURED = 4 };

/* Status word of RM_ReadWWN. 5 to 8 as the activation codes, for configured names that wait for their activation. */
enum {
    RM_WWN_STATUS_VOLATILE_ACTIVE = 1,
    RM_WWN_STATUS_CURRENT_VOLATILE = 3,
    RM_WWN_STATUS_CURRENT_NONVOLATILE = 4,
    RM_WWN_STATUS_NONE = 9
};

/* Bits of the word of RM_GetWWNCapability. */
enum {
    RM_WWN_CAN_NONVOLATILE = 0x0004,
    RM_WWN_CAN_VOLATILE = 0x0008,
    RM_WWN_NEEDS_REBOOT = 0x1000,
    RM_WWN_NEEDS_RESET = 0x2000,
    RM_WWN_READ_ONLY = 0x8000
};

/* States of RM_DiagBeacon and RM_DiagBeaconState. */
enum { RM_BEACON_NOT_AVAILABLE = 1, RM_BEACON_OFF = 2, RM_BEACON_ON = 3 };

/* `code` of RM_SetDriverParam: bit 0 permanent, bit 1 global. */
enum { RM_PARAM_PERMANENT = 1, RM_PARAM_GLOBAL = 2 };

/* ----------------------------------------------------------------------------------------------- attribute numbers */

/* Of the block of RM_GetHBAAttributes. "number": 32 bits; "text": as many bytes as its length, without terminator. */
enum {
    RM_ATTR_VPORT_MAPPING = 265,        /* number; 1 or 2: virtual ports are mapped to virtual machines */
    RM_ATTR_DEVICE_ID = 526,            /* number */
    RM_ATTR_MODEL_ID = 527,             /* number */
    RM_ATTR_OPERATIONAL_FIRMWARE = 528, /* text */
    RM_ATTR_IEEE_ADDRESS = 531,         /* 6 bytes */
    RM_ATTR_BOOT_CODE_ENABLED = 532,    /* number, 0 or 1 */
    RM_ATTR_BOOT_BIOS_VERSION = 534,    /* text */
    RM_ATTR_DIAG_VERSION = 544,         /* number */
    RM_ATTR_INITIAL_FIRMWARE = 545,     /* text */
    RM_ATTR_KERNEL_VERSION = 546,       /* text */
    RM_ATTR_SLI_MODE = 549,             /* number */
    RM_ATTR_BOARD_TEMPERATURE = 551,    /* number; bytes 0, 1, 2 are current, critical and warning degrees Celsius */
    RM_ATTR_PORT_NUMBER = 553,          /* number */
    RM_ATTR_PCI_BUS_NUMBER = 555,       /* number */
    RM_ATTR_FUNCTION_TYPE = 556,        /* number; 1, 2, 3: a converged function */
    RM_ATTR_PCI_FUNCTION_NUMBER = 560,  /* number */
    RM_ATTR_SP_FIRMWARE_VERSION = 563,  /* text */
    RM_ATTR_SP_FIRMWARE_NAME = 564,     /* text */
    RM_ATTR_ULP_FIRMWARE_VERSION = 565, /* text */
    RM_ATTR_ULP_FIRMWARE_NAME = 566,    /* text */
    RM_ATTR_UNIVERSAL_VERSION = 587,    /* text */
    RM_ATTR_X86_BIOS_VERSION = 588,     /* text */
    RM_ATTR_EFI_VERSION = 589,          /* text */
    RM_ATTR_FCODE_VERSION = 590         /* text */
};

/* Of the block of RM_GetPortAttributes. */
enum {
    RM_ATTR_LINK_STATE = 0x305,     /* number; 20, 21: an external loopback can exist */
    RM_ATTR_PORT_CONDITION = 0x306, /* number; 22: the port is disabled */
    RM_ATTR_FABRIC_NAME = 0x30F,    /* 8 bytes, all zero when no fabric answers */
    RM_ATTR_PORT_STATE = 802        /* number, as HBA_PORTATTRIBUTES.PortState and 20, 21, 22 */
};

/* Of the block of RM_GetLunAttributes. */
enum {
    RM_LUN_DEVICE_TYPE = 1, /* number, as a standard inquiry has it */
    RM_LUN_VENDOR = 2,      /* text */
    RM_LUN_PRODUCT = 3,     /* text */
    RM_LUN_REVISION = 4,    /* text */
    RM_LUN_BLOCKS = 5,      /* 64 bits, 0 for a unit without capacity */
    RM_LUN_BLOCK_SIZE = 6   /* number, bytes */
};

/* Of the block of RM_GetPortStatistics: 64-bit numbers, all ones for a counter that the hardware does not have. */
enum {
    RM_STAT_FIRST = 1025,
    RM_STAT_SECONDS_SINCE_RESET = 1025,
    RM_STAT_EXCHANGES_ORIGINATED = 1026,
    RM_STAT_EXCHANGES_RESPONDED = 1027,
    RM_STAT_TX_SEQUENCES = 1028,
    RM_STAT_RX_SEQUENCES = 1029,
    RM_STAT_TX_FRAMES = 1030,
    RM_STAT_RX_FRAMES = 1031,
    RM_STAT_TX_WORDS = 1032,
    RM_STAT_RX_WORDS = 1033,
    RM_STAT_LIP_COUNT = 1036,
    RM_STAT_NOS_COUNT = 1037,
    RM_STAT_ERROR_FRAMES = 1038,
    RM_STAT_DUMPED_FRAMES = 1039,
    RM_STAT_LINK_FAILURES = 1040,
    RM_STAT_LOSS_OF_SYNC = 1041,
    RM_STAT_LOSS_OF_SIGNAL = 1042,
    RM_STAT_PRIMITIVE_SEQUENCE_ERRORS = 1043,
    RM_STAT_INVALID_TX_WORDS = 1044,
    RM_STAT_CRC_ERRORS = 1045,
    RM_STAT_LINK_TRANSITIONS = 1046,
    RM_STAT_ACTIVE_RPIS = 1047,
    RM_STAT_ACTIVE_XRIS = 1048,
    RM_STAT_PRIMITIVE_SEQUENCE_TIMEOUTS = 1057,
    RM_STAT_ELASTIC_BUFFER_OVERRUNS = 1058,
    RM_STAT_ARBITRATION_TIMEOUTS = 1059,
    RM_STAT_LAST = 1059
};

/* ------------------------------------------------------------------------------------------------- attribute block */

/* What RM_GetHBAAttributes, RM_GetPortAttributes, RM_GetPortStatistics and RM_GetLunAttributes write: this header, then
 * records (RM_ATTRIBUTE and its value) one behind the other, each value padded with zero bytes to a multiple of 4, up
 * to `length`. `*size` is the buffer's capacity on the way in and the bytes used on the way out; a buffer that is too
 * small gives RM_STATUS_MORE_DATA and the need in `*size`. The caller's capacities are RM_*_BLOCK_SIZE.
 *
 * RM_GetAttributeValue refuses a block whose magic or check word is wrong (null, RM_STATUS_ERROR); it returns a pointer
 * to the value inside the block and its length without padding. Values are 4-byte aligned relative to the block. */
typedef struct {
    uint32_t magic;  /* RM_BLOCK_MAGIC */
    uint32_t length; /* bytes used, header included */
    uint32_t count;  /* records */
    uint32_t check;  /* magic ^ length ^ count ^ RM_BLOCK_CHECK, so that a damaged header is seen */
} RM_BLOCKHEADER;

typedef struct {
    uint16_t number;
    uint16_t length; /* of the value behind it, without padding */
} RM_ATTRIBUTE;

#define RM_BLOCK_MAGIC 0x4B4C424Eu
#define RM_BLOCK_CHECK 0x5A17C3D2u
#define RM_HBA_BLOCK_SIZE 2864u
#define RM_PORT_BLOCK_SIZE 2048u
#define RM_STATISTICS_BLOCK_SIZE 512u
#define RM_TEXT_SIZE 256u /* a text attribute with its terminator, cut at 255 */
#define RM_STATUS_TEXT_SIZE 256u

static_assert(sizeof(RM_BLOCKHEADER) == 16, "attribute block header");
static_assert(sizeof(RM_ATTRIBUTE) == 4, "attribute record head");

/* -------------------------------------------------------------------------------------------------------------------
 * vital product data (VPD) */

/* What RM_GetVPD writes: a length word, then PCI vital product data as the bus has it: large resource 0x82 (identifier
 * text), 0x90 (read-only fields), 0x91 (writable fields), each with a 16-bit little-endian length; in the last two,
 * fields of a two-letter keyword, a length byte and the value; small resource 0x78 ends the data. */
typedef struct {
    uint32_t length; /* bytes of PCI data that follow; RM_VPD_SIZE - 4 at most */
    uint8_t data[1];
} RM_VPDBLOCK;

/* Place in the walk of RM_GetNextVpdEntry. All zero starts; each call that answers 1 has put the next entry's tag there
 * and raised `index` by one. Tag: the two letters, or two bytes 130 for the identifier text. A call that answers 0 (end
 * of data, damaged data, or `index` at its limit) changes nothing. The value is text, at most valueSize - 1 bytes,
 * ended. A walk has RM_VPD_MAX_ENTRIES entries at most; a caller stops there, and when `index` does not rise. */
typedef struct {
    char tag[2];
    char end;      /* always 0, so that `tag` is a text */
    uint8_t index; /* entries handed out so far */
} RM_VPDCURSOR;

#define RM_VPD_SIZE 1024u
#define RM_VPD_CURSOR_SIZE 4u
#define RM_VPD_VALUE_SIZE 256u
#define RM_VPD_MAX_ENTRIES 255u
#define RM_VPD_TAG_PRODUCT_NAME 130 /* both bytes of the tag */

static_assert(sizeof(RM_VPDCURSOR) == RM_VPD_CURSOR_SIZE, "VPD cursor");
static_assert(offsetof(RM_VPDBLOCK, data) == 4, "VPD data");

/* -------------------------------------------------------------------------------------------------------------------
 * driver parameters */

/* A record of RM_GetDriverParams and RM_GetDriverParamsGlobal, which write an array of them without a header. `*count`
 * is the capacity in records on the way in and the number of records on the way out; 7 or 191 ask for a second try with
 * the count that came back. Texts fill their field without terminator when they are as long as it. */
typedef struct {
    char name[32];
    uint32_t lowLimit;
    uint32_t highLimit;
    uint32_t defaultValue; /* in the global list: the global value */
    uint32_t currentValue;
    uint16_t exportFlag;
    uint16_t dynamic;
    char help[80];
} RM_DRIVERPARAM;

#define RM_DRIVERPARAM_FIRST_COUNT 52u

static_assert(sizeof(RM_DRIVERPARAM) == 132, "driver parameter record");
static_assert(offsetof(RM_DRIVERPARAM, lowLimit) == 32, "words from index 8 on");
static_assert(offsetof(RM_DRIVERPARAM, exportFlag) == 48 && offsetof(RM_DRIVERPARAM, dynamic) == 50, "16-bit words");
static_assert(offsetof(RM_DRIVERPARAM, help) == 52, "help text");

/* -------------------------------------------------------------------------------------------------------------------
 * flash contents */

/* What RM_DiagGetLoadListParams fills: `count` entries, of which the last is the end-of-list record and no image, so
 * that there are count - 1 images; 0 and 1 mean none. Readers cut the number of images to RM_FLASH_MAX_IMAGES. Texts
 * may fill their field without terminator. The record is always given whole. */
typedef struct {
    char name[32];
    char version[32];
    uint32_t type; /* free for the library; 0xFFFFFFFF in the end-of-list record */
    uint32_t size; /* bytes in flash */
} RM_FLASHIMAGE;

#define RM_FLASH_MAX_IMAGES 64u

typedef struct {
    uint32_t count;
    uint32_t reserved;
    RM_FLASHIMAGE image[RM_FLASH_MAX_IMAGES + 1];
} RM_FLASHCONTENTS;

static_assert(sizeof(RM_FLASHIMAGE) == 72, "flash image record");
static_assert(sizeof(RM_FLASHCONTENTS) == 4688, "flash contents");

/* -------------------------------------------------------------------------------------------------------------------
 * transceiver */

/* What RM_GetSffData writes: pages A0 and A2 of the port's module by SFF-8472, as read from it. `*size` is the capacity
 * on the way in, the bytes written on the way out; 256 when the module has no page A2. */
typedef struct {
    uint8_t a0[256];
    uint8_t a2[256];
} RM_SFFDATA;

#define RM_SFF_SIZE 512u

static_assert(sizeof(RM_SFFDATA) == RM_SFF_SIZE, "transceiver pages");

/* -------------------------------------------------------------------------------------------------------------------
 * PCI registers */

/* What RM_DiagReadPCIRegistersV2 fills: the standard configuration header (little-endian), then registers behind it. */
typedef struct {
    uint8_t header[64];
    uint8_t registers[256];
} RM_PCIREGISTERS;

static_assert(sizeof(RM_PCIREGISTERS) == 320, "PCI registers");

/* -------------------------------------------------------------------------------------------------------------------
 * targets and LUN lists */

/* What RM_GetLunList writes. `count` is the capacity on the way in, the number of LUNs on the way out (also with 7). */
typedef struct {
    uint8_t fcpLun[8]; /* wire order */
    uint32_t osLun;
} RM_LUNENTRY;

typedef struct {
    uint32_t count;
    uint32_t reserved;
    RM_LUNENTRY entry[1];
} RM_LUNLIST;

#define RM_LUNLIST_SIZE(n) (8u + 12u * (size_t)(n))

static_assert(sizeof(RM_LUNENTRY) == 12, "LUN entry");
static_assert(offsetof(RM_LUNLIST, entry) == 8, "LUN list header");

/* What RM_VPListTargets and RM_GetFcpTargetMapping write, by the same count rule. */
typedef struct {
    uint32_t count;
    uint32_t reserved;
    HBA_FCPSCSIENTRY entry[1];
} RM_TARGETLIST;

#define RM_TARGETLIST_SIZE(n) (8u + sizeof(HBA_FCPSCSIENTRY) * (size_t)(n))
#define RM_FCPMAPPING_FIRST_SIZE 316u /* what a caller of RM_GetFcpTargetMapping gives for one entry */

static_assert(offsetof(RM_TARGETLIST, entry) == 8, "target list header");
#if defined(__x86_64__)
static_assert(sizeof(HBA_FCPSCSIENTRY) == 304, "mapping entry");
#endif

/* -------------------------------------------------------------------------------------------------------------------
 * local port records */

/* The argument that names a record of RM_GetLocalHBAInfo. */
typedef struct {
    uint32_t reserved;
    uint32_t index; /* from 0 */
} RM_LOCALINDEX;

/* What RM_GetLocalHBAInfo fills; one record for each local port. Always given whole. */
typedef struct {
    HBA_WWN wwpn;
    HBA_WWN wwnn;
    char adapterName[256];
    char model[256];
    uint32_t portIndex;
    uint32_t reserved[891];
} RM_LOCALHBAINFO;

#define RM_LOCAL_MAX_RECORDS 1024u /* readers walk no further, whatever the number of local adapters */

static_assert(sizeof(RM_LOCALINDEX) == 8, "record index");
static_assert(sizeof(RM_LOCALHBAINFO) == 4096, "local port record");

/* -------------------------------------------------------------------------------------------------------------------
 * virtual ports */

typedef struct {
    HBA_WWN wwpn;
    HBA_WWN wwnn;
    uint32_t portFcId;
    uint32_t reserved;
} RM_VPORTENTRY;

/* What RM_VPList writes. `count`: capacity in, number of virtual ports out (also with 7). */
typedef struct {
    uint32_t count;
    RM_VPORTENTRY entry[1];
} RM_VPORTLIST;

#define RM_VPORTLIST_SIZE(n) (4u + 24u * (size_t)(n))
#define RM_VPORT_MAX_ENTRIES 1023u

static_assert(sizeof(RM_VPORTENTRY) == 24, "virtual port entry");
static_assert(offsetof(RM_VPORTLIST, entry) == 4, "virtual port list header");

/* What RM_VPGetAttributes fills; the caller sets `version` to RM_VPORT_VERSION. */
typedef struct {
    uint8_t version;
    uint8_t reserved0[3];
    HBA_WWN wwpn;
    HBA_WWN wwnn;
    char name[256];
    uint32_t portFcId;
    uint32_t state; /* as HBA_PORTSTATE */
    uint8_t reserved1[60];
} RM_VPORTATTRIBUTES;

#define RM_VPORT_VERSION 3

static_assert(sizeof(RM_VPORTATTRIBUTES) == 344, "virtual port attributes");
static_assert(offsetof(RM_VPORTATTRIBUTES, name) == 20, "virtual port name");

/* What RM_GetVMFromVPort writes, by the count rule. */
typedef struct {
    char name[512];
} RM_VMNAME;

typedef struct {
    uint32_t count;
    RM_VMNAME entry[1];
} RM_VMLIST;

#define RM_VMLIST_SIZE(n) (4u + 512u * (size_t)(n))

typedef struct {
    char identity[256];
    char virtualPort[256]; /* WWPN as text */
    char serverName[256];
    char machineName[256];
    char guestOsName[256];
    uint32_t memorySize; /* MiB */
    uint32_t reserved[3];
} RM_VMINFO;

static_assert(offsetof(RM_VMLIST, entry) == 4 && sizeof(RM_VMLIST) == 516, "virtual machine list");
static_assert(sizeof(RM_VMINFO) == 1296, "virtual machine record");

/* -------------------------------------------------------------------------------------------------------------------
 * dumps */

typedef struct {
    char name[256];
} RM_DUMPNAME;

/* What RM_GetDumpFileNames writes. `count`: capacity in; out the number of names, and with 191 the need. A capacity of
 * 0 stands for the count that the last answer of 191 for this port gave, since callers give their second list
 * zero-filled. */
typedef struct {
    uint32_t count;
    uint32_t reserved;
    RM_DUMPNAME entry[1];
} RM_DUMPLIST;

#define RM_DUMPLIST_SIZE(n) (8u + 256u * (size_t)(n))
#define RM_DUMP_DIRECTORY_SIZE 256u
#define RM_DUMP_FIRST_COUNT 4u
#define RM_DUMP_RETENTION_MIN 1u
#define RM_DUMP_RETENTION_MAX 20u

static_assert(offsetof(RM_DUMPLIST, entry) == 8 && sizeof(RM_DUMPNAME) == 256, "dump name list");

/* -------------------------------------------------------------------------------------------------------------------
 * diagnostics */

/* What RM_DiagGetResults fills; RM_STATUS_NO_RESULT_YET leaves only `state` meaningful. */
typedef struct {
    uint32_t testId;
    uint32_t state; /* RM_DIAG_* */
    uint32_t testType;
    uint32_t cyclesCompleted;
    uint32_t executionTime; /* seconds */
    uint32_t resultCode;    /* 0 success, 1 to 19 as the diagnostics name them */
    uint32_t loopsRequested;
    uint32_t loopsFailed;
    uint32_t reserved[4];
} RM_DIAGRESULT;

enum { RM_DIAG_PENDING = 1, RM_DIAG_RUNNING = 2, RM_DIAG_CANCELLED = 5, RM_DIAG_COMPLETED = 6 };

static_assert(sizeof(RM_DIAGRESULT) == 48, "twelve words");
static_assert(offsetof(RM_DIAGRESULT, state) == 4 && offsetof(RM_DIAGRESULT, resultCode) == 20, "words 1 and 5");
static_assert(offsetof(RM_DIAGRESULT, loopsFailed) == 28, "word 7");

/* -------------------------------------------------------------------------------------------------------------------
 * tag tables */

typedef struct {
    HBA_WWN source;
    HBA_WWN target;
    uint8_t reserved0[16];
    uint8_t tag;
    uint8_t reserved1[3];
} CPQFC_QOSENTRY;

/* Read and written by CPQFC_QoSGetConfig and CPQFC_QoSSetConfig. Get: `count` is the capacity on the way in; with fewer
 * than needed, RM_STATUS_MORE_DATA and the need; an empty table is status 0 with count 0. */
typedef struct {
    uint32_t count;
    CPQFC_QOSENTRY entry[1];
} CPQFC_QOSCONFIG;

#define CPQFC_QOSCONFIG_SIZE(n) (4u * (9u * (size_t)(n) + 1u))
#define CPQFC_QOS_MAX_ENTRIES 65536u

static_assert(sizeof(CPQFC_QOSENTRY) == 36, "tag entry");
static_assert(offsetof(CPQFC_QOSENTRY, tag) == 32 && offsetof(CPQFC_QOSCONFIG, entry) == 4, "tag table");

/* -------------------------------------------------------------------------------------------------------------------
 * operations */

/* Called on a thread of the Common HBA API for each event of a registered port. */
typedef void NVR_PORT_EVENT_CALLBACK(void* data, HBA_WWN portWwn, HBA_UINT32 eventType, HBA_UINT32 fabricPortId);

/* The operations, by family. Each row: X(result type, name, result when nothing is found, (parameters), (arguments)).
 * A `wwn` is the local port's WWPN; `host` too, where a `target` port is named beside it. */

/* Known in liblrmapi.so as LRM_x, in librmapi.so as LRM_x or RM_x. */
#define NVR_MANAGEMENT_OPERATIONS(X)                                                                                   \
    X(int32_t, RM_InitLib, 1, (void), ())                                                                              \
    X(uint32_t, RM_GetHBAAttributes, 1, (HBA_WWN wwn, void* block, uint32_t* size), (wwn, block, size))                \
    X(uint32_t, RM_GetPortAttributes, 1, (HBA_WWN wwn, void* block, uint32_t* size), (wwn, block, size))               \
    X(uint32_t, RM_GetPortStatistics, 1, (HBA_WWN wwn, void* block, uint32_t* size), (wwn, block, size))               \
    X(uint32_t, RM_GetDriverType, 1, (HBA_WWN wwn, uint32_t * type), (wwn, type))                                      \
    X(uint32_t, RM_GetWWNCapability, 1, (HBA_WWN wwn, uint32_t * capability), (wwn, capability))                       \
    X(uint32_t, RM_ReadWWN, 1, (HBA_WWN wwn, uint32_t type, HBA_WWN * wwpn, HBA_WWN * wwnn, uint32_t * status),        \
      (wwn, type, wwpn, wwnn, status))                                                                                 \
    X(uint32_t, RM_ChangeWWN, 1,                                                                                       \
      (HBA_WWN wwn, HBA_WWN newWwpn, HBA_WWN newWwnn, uint32_t type, uint32_t * activation),                           \
      (wwn, newWwpn, newWwnn, type, activation))                                                                       \
    X(uint32_t, RM_RestoreWWN, 1, (HBA_WWN wwn, uint32_t type, uint32_t * activation), (wwn, type, activation))        \
    X(uint32_t, RM_ResetHBA, 1, (HBA_WWN wwn, uint32_t one), (wwn, one))                                               \
    X(uint32_t, RM_DownloadFirmware, 1, (HBA_WWN wwn, const char* path, uint32_t zero), (wwn, path, zero))             \
    X(uint32_t, RM_SetBootBiosState, 1, (HBA_WWN wwn, uint32_t enable), (wwn, enable))                                 \
    X(uint32_t, RM_GetDriverParams, 1, (HBA_WWN wwn, void* records, uint32_t* count), (wwn, records, count))           \
    X(uint32_t, RM_GetDriverParamsGlobal, 1, (HBA_WWN wwn, void* records, uint32_t* count), (wwn, records, count))     \
    X(uint32_t, RM_SetDriverParam, 1, (HBA_WWN wwn, const char* assignment, uint32_t code), (wwn, assignment, code))   \
    X(uint32_t, RM_GenerateDump, 1, (HBA_WWN zero, HBA_WWN wwn), (zero, wwn))                                          \
    X(uint32_t, RM_GenerateEfdDump, 1, (HBA_WWN wwn, uint32_t option, uint32_t zero), (wwn, option, zero))             \
    X(uint32_t, RM_GetDumpDirectoryA, 1, (HBA_WWN wwn, char* buffer, uint32_t size), (wwn, buffer, size))              \
    X(uint32_t, RM_SetDumpDirectory, 1, (HBA_WWN wwn, const char* path), (wwn, path))                                  \
    X(uint32_t, RM_GetDumpFileNames, 1, (HBA_WWN wwn, void* list), (wwn, list))                                        \
    X(uint32_t, RM_DeleteDumpFiles, 1, (HBA_WWN wwn), (wwn))                                                           \
    X(uint32_t, RM_GetDumpRetentionCount, 1, (HBA_WWN wwn, uint32_t * count), (wwn, count))                            \
    X(uint32_t, RM_SetDumpRetentionCount, 1, (HBA_WWN wwn, uint32_t count), (wwn, count))                              \
    X(uint32_t, RM_VPList, 1, (HBA_WWN wwn, void* list), (wwn, list))                                                  \
    X(uint32_t, RM_VPGetAttributes, 1, (HBA_WWN wwn, HBA_WWN vport, RM_VPORTATTRIBUTES * attributes),                  \
      (wwn, vport, attributes))                                                                                        \
    X(uint32_t, RM_VPListTargets, 1, (HBA_WWN wwn, HBA_WWN vport, void* list), (wwn, vport, list))                     \
    X(uint32_t, RM_GetVMFromVPort, 1, (HBA_WWN vport, void* list), (vport, list))                                      \
    X(uint32_t, RM_GetVMInfo, 1, (const RM_VMNAME* name, RM_VMINFO* info), (name, info))                               \
    X(uint32_t, RM_SetPortEnabled, 1, (HBA_WWN wwn, uint32_t enable, uint8_t * activation), (wwn, enable, activation)) \
    X(uint32_t, RM_GetVPD, 1, (HBA_WWN wwn, void* block, uint32_t* size), (wwn, block, size))                          \
    X(uint32_t, RM_GetSffData, 1, (HBA_WWN wwn, void* data, uint32_t* size), (wwn, data, size))                        \
    X(uint32_t, RM_GetLunList, 1, (HBA_WWN host, HBA_WWN target, uint32_t zero, void* list),                           \
      (host, target, zero, list))                                                                                      \
    X(uint32_t, RM_GetLunAttributes, 1, (HBA_WWN host, HBA_WWN target, HBA_UINT64 lun, void* block, uint32_t* size),   \
      (host, target, lun, block, size))                                                                                \
    X(uint32_t, RM_ScsiInquiry, 1,                                                                                     \
      (HBA_WWN host, HBA_WWN target, HBA_UINT64 lun, void* response, uint32_t responseSize, void* sense,               \
       uint32_t senseSize),                                                                                            \
      (host, target, lun, response, responseSize, sense, senseSize))                                                   \
    X(uint32_t, RM_ScsiReadCapacity, 1,                                                                                \
      (HBA_WWN host, HBA_WWN target, HBA_UINT64 lun, void* response, uint32_t responseSize, void* sense,               \
       uint32_t senseSize),                                                                                            \
      (host, target, lun, response, responseSize, sense, senseSize))                                                   \
    X(uint32_t, RM_GetFcpTargetMapping, 1, (HBA_WWN wwn, void* list), (wwn, list))                                     \
    X(uint32_t, RM_DiagBeacon, 1, (HBA_WWN wwn, uint32_t state), (wwn, state))                                         \
    X(uint32_t, RM_DiagBeaconState, 1, (HBA_WWN wwn, uint32_t * state), (wwn, state))                                  \
    X(uint32_t, RM_DiagReadPCIRegistersV2, 1, (HBA_WWN wwn, RM_PCIREGISTERS * registers), (wwn, registers))            \
    X(uint32_t, RM_DiagGetLoadListParams, 1, (HBA_WWN wwn, RM_FLASHCONTENTS * contents), (wwn, contents))              \
    X(uint32_t, RM_DiagRunPOST, 1, (HBA_WWN wwn, uint32_t * testId), (wwn, testId))                                    \
    X(uint32_t, RM_DiagLoopBackTestV3, 1,                                                                              \
      (HBA_WWN wwn, uint32_t internal, uint32_t cycles, uint32_t halt, uint32_t * testId, uint32_t zero,               \
       const void* pattern),                                                                                           \
      (wwn, internal, cycles, halt, testId, zero, pattern))                                                            \
    X(uint32_t, RM_DiagPciLoopBackTestV2, 1,                                                                           \
      (HBA_WWN wwn, uint32_t cycles, uint32_t halt, uint32_t * testId, uint32_t zero, const void* pattern),            \
      (wwn, cycles, halt, testId, zero, pattern))                                                                      \
    X(uint32_t, RM_DiagEchoTestV2, 1,                                                                                  \
      (HBA_WWN wwn, HBA_WWN target, uint32_t cycles, uint32_t halt, uint32_t * testId, uint32_t zero,                  \
       const void* pattern),                                                                                           \
      (wwn, target, cycles, halt, testId, zero, pattern))                                                              \
    X(uint32_t, RM_DiagGetResults, 1, (HBA_WWN wwn, uint32_t testId, RM_DIAGRESULT * result), (wwn, testId, result))   \
    X(uint32_t, RM_DiagCancelDiagnostic, 1, (HBA_WWN wwn, uint32_t testId), (wwn, testId))

/* Known in liblrmapi.so as RM_x, in librmapi.so as LRM_x or RM_x.
 * RM_ValidateWwn answers 5 for a name that no port can have. RM_IsLocalHBA: `*local` is not 0 for a local port.
 * RM_StatusString leaves the buffer empty for a status without a text. RM_VerifyFirmwareA gets a zero host. */
#define NVR_PLAIN_MANAGEMENT_OPERATIONS(X)                                                                             \
    X(uint32_t, RM_ValidateWwn, 1, (const HBA_WWN* wwn), (wwn))                                                        \
    X(uint32_t, RM_StatusString, 1, (uint32_t status, char* buffer, uint32_t size), (status, buffer, size))            \
    X(uint32_t, RM_IsLocalHBA, 1, (HBA_WWN wwn, uint32_t * local), (wwn, local))                                       \
    X(uint32_t, RM_ImportHBAFileA, 1, (const char* path), (path))                                                      \
    X(uint32_t, RM_VerifyFirmwareA, 1, (HBA_WWN host, HBA_WWN wwn, const char* path), (host, wwn, path))               \
    X(uint32_t, RM_GetLocalHBAInfo, 1, (const RM_LOCALINDEX* index, RM_LOCALHBAINFO* info), (index, info))             \
    X(uint32_t, RM_GetNextVpdEntry, 0,                                                                                 \
      (const void* block, RM_VPDCURSOR* cursor, uint32_t cursorSize, char* value, uint32_t valueSize),                 \
      (block, cursor, cursorSize, value, valueSize))                                                                   \
    X(uint32_t, RM_GetNumberOfLocalAdapters, 0, (void), ())                                                            \
    X(void*, RM_GetAttributeValue, NULL, (void* block, uint16_t number, uint16_t* length, uint32_t* status),           \
      (block, number, length, status))

/* Known in libHBAAPI.so and librmapi.so by the same name. HBA_LoadLibrary and HBA_FreeLibrary may be missing without
 * fault. */
#define NVR_HBA_OPERATIONS(X)                                                                                          \
    X(HBA_STATUS, HBA_LoadLibrary, 1, (void), ())                                                                      \
    X(HBA_STATUS, HBA_FreeLibrary, 1, (void), ())                                                                      \
    X(HBA_UINT32, HBA_GetNumberOfAdapters, 0, (void), ())                                                              \
    X(HBA_STATUS, HBA_GetAdapterName, 1, (HBA_UINT32 index, char* name), (index, name))                                \
    X(HBA_HANDLE, HBA_OpenAdapter, 1, (char* name), (name))                                                            \
    X(void, HBA_CloseAdapter, (void)0, (HBA_HANDLE handle), (handle))                                                  \
    X(HBA_STATUS, HBA_GetAdapterAttributes, 1, (HBA_HANDLE handle, HBA_ADAPTERATTRIBUTES * attributes),                \
      (handle, attributes))                                                                                            \
    X(HBA_STATUS, HBA_GetAdapterPortAttributes, 1,                                                                     \
      (HBA_HANDLE handle, HBA_UINT32 portIndex, HBA_PORTATTRIBUTES * attributes), (handle, portIndex, attributes))     \
    X(void, HBA_RefreshInformation, (void)0, (HBA_HANDLE handle), (handle))                                            \
    X(HBA_STATUS, HBA_GetFcpTargetMapping, 1, (HBA_HANDLE handle, HBA_FCPTARGETMAPPING * mapping), (handle, mapping))  \
    X(HBA_STATUS, HBA_SendScsiInquiry, 1,                                                                              \
      (HBA_HANDLE handle, HBA_WWN portWwn, HBA_UINT64 lun, HBA_UINT8 evpd, HBA_UINT32 pageCode, void* response,        \
       HBA_UINT32 responseSize, void* sense, HBA_UINT32 senseSize),                                                    \
      (handle, portWwn, lun, evpd, pageCode, response, responseSize, sense, senseSize))                                \
    X(HBA_STATUS, HBA_SendReadCapacity, 1,                                                                             \
      (HBA_HANDLE handle, HBA_WWN portWwn, HBA_UINT64 lun, void* response, HBA_UINT32 responseSize, void* sense,       \
       HBA_UINT32 senseSize),                                                                                          \
      (handle, portWwn, lun, response, responseSize, sense, senseSize))                                                \
    X(HBA_STATUS, HBA_RegisterForAdapterPortEvents, 1,                                                                 \
      (NVR_PORT_EVENT_CALLBACK * callback, void* userData, HBA_HANDLE handle, HBA_WWN portWwn,                         \
       HBA_CALLBACKHANDLE* callbackHandle),                                                                            \
      (callback, userData, handle, portWwn, callbackHandle))                                                           \
    X(HBA_STATUS, HBA_RemoveCallback, 1, (HBA_CALLBACKHANDLE callbackHandle), (callbackHandle))

/* Known in libtssdm.so and librmapi.so by the same name. CPQFC_OpenAdapter gives 0 for failure. */
#define NVR_CPQFC_OPERATIONS(X)                                                                                        \
    X(uint32_t, CPQFC_LoadLibrary, 1, (void), ())                                                                      \
    X(uint32_t, CPQFC_FreeLibrary, 1, (void), ())                                                                      \
    X(uint32_t, CPQFC_GetNumberOfAdapters, 1, (void), ())                                                              \
    X(uint32_t, CPQFC_OpenAdapter, 1, (const char* name), (name))                                                      \
    X(void, CPQFC_CloseAdapter, (void)0, (uint32_t handle), (handle))                                                  \
    X(uint32_t, CPQFC_QoSGetConfig, 1, (uint32_t handle, CPQFC_QOSCONFIG * config), (handle, config))                  \
    X(uint32_t, CPQFC_QoSSetConfig, 1, (uint32_t handle, const CPQFC_QOSCONFIG* config), (handle, config))             \
    X(uint32_t, CPQFC_QoSGetGlobalFlag, 1, (uint32_t handle, uint32_t * flag), (handle, flag))                         \
    X(uint32_t, CPQFC_QoSSetGlobalFlag, 1, (uint32_t handle, uint32_t flag), (handle, flag))

/* For each operation `x` its function type `x_t`, for example RM_GetVPD_t. */
#define NVR_DECLARE_OPERATION_TYPE(result, name, missing, parameters, arguments) typedef result name##_t parameters;
NVR_MANAGEMENT_OPERATIONS(NVR_DECLARE_OPERATION_TYPE)
NVR_PLAIN_MANAGEMENT_OPERATIONS(NVR_DECLARE_OPERATION_TYPE)
NVR_HBA_OPERATIONS(NVR_DECLARE_OPERATION_TYPE)
NVR_CPQFC_OPERATIONS(NVR_DECLARE_OPERATION_TYPE)
#undef NVR_DECLARE_OPERATION_TYPE

#ifdef __cplusplus
}
#endif

#endif /* _foundation_management_api_h */
