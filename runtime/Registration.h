/// The seam between the CMPI bridge and a provider: one record a provider, and one procedure with an operation code.
#pragma once

#include "runtime/Export.h"
#include "runtime/Instance.h"

namespace cimple {

/// Operation codes of a Provider_Proc, with their arguments. Results are the provider's statuses below.
enum Operation : int {
    OP_GET_META_CLASS = 0,         // out: const Meta_Class**
    OP_CREATE_PROVIDER = 1,        // out: void**
    OP_DESTROY_PROVIDER = 2,       // provider, may be null
    OP_LOAD = 3,                   // provider
    OP_UNLOAD = 4,                 // provider
    OP_GET_INSTANCE = 5,           // provider, const Instance* model, out: Instance**
    OP_ENUM_INSTANCES = 6,         // provider, const Instance* model, Enum_Handler_Proc, data
    OP_CREATE_INSTANCE = 7,        // provider, Instance*
    OP_DELETE_INSTANCE = 8,        // provider, const Instance*
    OP_MODIFY_INSTANCE = 9,        // provider, const Instance* model, const Instance*
    OP_INVOKE_METHOD = 10,         // provider, const Instance* target, Instance* method record
    OP_ENABLE_INDICATIONS = 11,    // provider, Indication_Handler_Proc, data
    OP_DISABLE_INDICATIONS = 12,   // provider
    OP_GET_REPOSITORY = 13,        // out: const Meta_Repository**
    OP_ENUM_ASSOCIATOR_NAMES = 14, // provider, const Instance*, const String* result class, const String* role,
                                   // const String* result role, Enum_Handler_Proc, data
    OP_ENUM_REFERENCES = 15,       // provider, const Instance*, const Instance* model, const String* role,
                                   // Enum_Handler_Proc, data
    OP_ENUM_ASSOCIATORS = 16,      // as OP_ENUM_ASSOCIATOR_NAMES
};

/// Statuses of a provider's operations; 0 is success everywhere.
enum Load_Status { LOAD_OK = 0, LOAD_FAILED = 30 };
enum Unload_Status { UNLOAD_OK = 0, UNLOAD_FAILED = 40 };
enum Get_Instance_Status {
    GET_INSTANCE_OK = 0,
    GET_INSTANCE_NOT_FOUND = 60,
    GET_INSTANCE_UNSUPPORTED = 61,
    GET_INSTANCE_INVALID_PARAMETER = 62,
    GET_INSTANCE_ACCESS_DENIED = 63,
    GET_INSTANCE_FAILED = 64
};
enum Enum_Instances_Status { ENUM_INSTANCES_OK = 0, ENUM_INSTANCES_FAILED = 70, ENUM_INSTANCES_ACCESS_DENIED = 71 };
enum Create_Instance_Status {
    CREATE_INSTANCE_OK = 0,
    CREATE_INSTANCE_DUPLICATE = 80,
    CREATE_INSTANCE_UNSUPPORTED = 81,
    CREATE_INSTANCE_INVALID_PARAMETER = 82,
    CREATE_INSTANCE_ACCESS_DENIED = 83,
    CREATE_INSTANCE_FAILED = 84
};
enum Delete_Instance_Status {
    DELETE_INSTANCE_OK = 0,
    DELETE_INSTANCE_NOT_FOUND = 90,
    DELETE_INSTANCE_UNSUPPORTED = 91,
    DELETE_INSTANCE_ACCESS_DENIED = 92,
    DELETE_INSTANCE_FAILED = 93
};
enum Modify_Instance_Status {
    MODIFY_INSTANCE_OK = 0,
    MODIFY_INSTANCE_NOT_FOUND = 100,
    MODIFY_INSTANCE_UNSUPPORTED = 101,
    MODIFY_INSTANCE_INVALID_PARAMETER = 102,
    MODIFY_INSTANCE_ACCESS_DENIED = 103,
    MODIFY_INSTANCE_FAILED = 104
};
enum Enum_Associator_Names_Status {
    ENUM_ASSOCIATOR_NAMES_OK = 0,
    ENUM_ASSOCIATOR_NAMES_FAILED = 110,
    ENUM_ASSOCIATOR_NAMES_UNSUPPORTED = 111,
    ENUM_ASSOCIATOR_NAMES_ACCESS_DENIED = 112
};
enum Enum_References_Status {
    ENUM_REFERENCES_OK = 0,
    ENUM_REFERENCES_FAILED = 120,
    ENUM_REFERENCES_UNSUPPORTED = 121,
    ENUM_REFERENCES_ACCESS_DENIED = 122
};
enum Invoke_Method_Status {
    INVOKE_METHOD_OK = 0,
    INVOKE_METHOD_FAILED = 130,
    INVOKE_METHOD_UNSUPPORTED = 131,
    INVOKE_METHOD_ACCESS_DENIED = 132
};
enum Enable_Indications_Status { ENABLE_INDICATIONS_OK = 0, ENABLE_INDICATIONS_FAILED = 140 };
enum Disable_Indications_Status { DISABLE_INDICATIONS_OK = 0, DISABLE_INDICATIONS_FAILED = 150 };
enum Enum_Associators_Status {
    ENUM_ASSOCIATORS_OK = 0,
    ENUM_ASSOCIATORS_FAILED = 170,
    ENUM_ASSOCIATORS_UNSUPPORTED = 171,
    ENUM_ASSOCIATORS_ACCESS_DENIED = 172
};

/// Takes one instance of an enumeration and its ownership (one count); the closing call has a null instance and the
/// operation's status. The result is advice, and providers ignore it.
using Enum_Handler_Proc = bool (*)(Instance* instance, int status, void* data);

/// What a provider hands its instances to.
struct Enum_Handler {
    Enum_Handler_Proc proc;
    void* data;
    /// Hands `instance` over.
    void handle(Instance* instance) const { proc(instance, 0, data); }
};

/// Takes one indication and its ownership; null is the provider's stop word and gives false.
using Indication_Handler_Proc = bool (*)(Instance* instance, void* data);

/// What an indication provider is given by enable_indications and keeps until disable_indications.
struct Indication_Handler {
    Indication_Handler_Proc proc;
    void* data;
    bool handle(Instance* instance) const { return proc(instance, data); }
};

struct Registration;

/// One function a provider: operation `code` with eight untyped words. Result: a status, or -1 for a code that the kind
/// of provider does not have. Throws what the provider throws.
using Provider_Proc = int (*)(const Registration* registration, int code, void* arg0, void* arg1, void* arg2,
                              void* arg3, void* arg4, void* arg5, void* arg6, void* arg7);

struct Registration {
    const char* module_name;
    const char* provider_name;
    Provider_Proc proc;
    const Meta_Class* meta_class;
    Registration* next;
};

/// The head of the module's list of providers.
extern "C" CIMPLE_EXPORT Registration* cimple_module();

} // namespace cimple
