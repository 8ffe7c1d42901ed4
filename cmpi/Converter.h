/// Whole CMPI objects out of instances and back: what the operations and the up-calls deal in.
///
/// All give 0, or 1 where nothing came out; a single feature that cannot be converted is logged and left out. CMPI
/// objects that come out belong to the caller, who gives them back to the broker; instances come with one count. Those
/// that are read get the namespace of `op`, and so do instances inside them that have none.
#pragma once

#include <cmpift.h>

#include "cmpi/Container.h"
#include "cmpi/cmpi_call.h"

namespace cimple {

/// What the objects of one answer have in common.
struct Answer_Features {
    Feature_List keys{META_FLAG_KEY}, all{0};
};

/// The path of an instance: its class and keys. `features`: of the answer that it is one of, null for an only one.
int make_cmpi_object_path(const CMPIBroker* broker, const Instance* instance, const char* name_space,
                          Made<CMPIObjectPath>& out, Answer_Features* features = nullptr);

/// An instance on `path` with all that is not null, of the properties named in `properties` (null: all; the class's
/// keys are told to the server too). A null path is logged and built here.
int make_CMPI_instance(const CMPIBroker* broker, const Instance* instance, const char* name_space,
                       const CMPIObjectPath* path, const char** properties, Made<CMPIInstance>& out,
                       Answer_Features* features = nullptr);

/// An instance with the keys of `op` alone.
int make_cimple_reference(const CMPIBroker* broker, const Meta_Class* meta_class, const CMPIObjectPath* op,
                          Instance*& out, unsigned depth = 0);

/// An instance with the properties of `inst`.
int make_cimple_instance(const CMPIBroker* broker, const Meta_Class* meta_class, const CMPIObjectPath* op,
                         const CMPIInstance* inst, Instance*& out, unsigned depth = 0);

/// The record of a method call, with its In parameters out of `in`.
int make_cimple_method(const CMPIBroker* broker, const Meta_Class* meta_class, const Meta_Method* method,
                       const CMPIObjectPath* op, const CMPIArgs* in, Instance*& out);

/// The Out parameters of a method record into `out`, and its return value, which is a failure when null.
int make_method_out(const CMPIBroker* broker, const char* name_space, const Instance* record, CMPIArgs* out,
                    Value& return_value);

/// The namespace of a path; "" where it has none. Lives as long as the request.
const char* name_space_of(const CMPIObjectPath* op);

} // namespace cimple
