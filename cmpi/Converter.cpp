#include "cmpi/Converter.h"

#include <cassert>
#include <vector>

#include "cmpi/CMPI_Containers.h"
#include "cmpi/warnings.h"

namespace cimple {

namespace {

// Containers read and write, so they take objects that may be written to; reading ones leave them as they are.
template <class Object>
Object* writable(const Object* object)
{
    return const_cast<Object*>(object);
}

std::vector<const char*> key_names(const Meta_Record* record)
{
    std::vector<const char*> names;
    for (std::size_t i = 0; i < record->num_meta_features; ++i)
        if (is_key(record->meta_features[i])) names.push_back(record->meta_features[i]->name);
    names.push_back(nullptr);
    return names;
}

int finish(const CMPIObjectPath* op, Ref<Instance>& read, Instance*& out)
{
    if (!read) return 1;
    set_name_space_recursive(read.get(), name_space_of(op), false);
    out = read.release();
    return 0;
}

} // namespace

const char* name_space_of(const CMPIObjectPath* op)
{
    CMPIStatus status;
    const char* name_space = chars_of(ask(status, op, &CMPIObjectPathFT::getNameSpace));
    return name_space ? name_space : "";
}

int make_cmpi_object_path(const CMPIBroker* broker, const Instance* instance, const char* name_space,
                          Made<CMPIObjectPath>& out, Answer_Features* features)
{
    if (!instance) return 1;
    CMPIStatus status;
    Made<CMPIObjectPath> path(
        ask(status, broker, &CMPIBrokerEncFT::newObjectPath, name_space, record_of(instance)->name));
    if (!path || status.rc != CMPI_RC_OK) return 1;
    CMPIObjectPath_Container container(broker, nullptr, name_space, path.get());
    if ((features ? container.convert(instance, features->keys) : container.convert(instance, META_FLAG_KEY)) != 0)
        return 1;
    out = std::move(path);
    return 0;
}

int make_CMPI_instance(const CMPIBroker* broker, const Instance* instance, const char* name_space,
                       const CMPIObjectPath* path, const char** properties, Made<CMPIInstance>& out,
                       Answer_Features* features)
{
    if (!instance) return 1;
    Made<CMPIObjectPath> built;
    if (!path) {
        CONVERSION_WARN("No ObjectPath built before call to make_CMPI_instance");
        if (make_cmpi_object_path(broker, instance, name_space, built) != 0) return 1;
        path = built.get();
    }
    CMPIStatus status;
    Made<CMPIInstance> made(ask(status, broker, &CMPIBrokerEncFT::newInstance, path));
    if (!made || status.rc != CMPI_RC_OK) return 1;
    if (properties) {
        std::vector<const char*> keys = key_names(record_of(instance));
        tell(made.get(), &CMPIInstanceFT::setPropertyFilter, properties, keys.data());
    }
    CMPIInstance_Container container(broker, nullptr, name_space, made.get());
    if ((features ? container.convert(instance, features->all) : container.convert(instance, 0)) != 0) return 1;
    out = std::move(made);
    return 0;
}

int make_cimple_reference(const CMPIBroker* broker, const Meta_Class* meta_class, const CMPIObjectPath* op,
                          Instance*& out, unsigned depth)
{
    CMPIObjectPath_Container container(broker, meta_class->meta_repository, nullptr, writable(op), depth);
    Ref<Instance> read(create(meta_class, false));
    Instance* instance = read.get();
    if (container.convert(meta_class, META_FLAG_KEY, instance) != 0) return 1;
    return finish(op, read, out);
}

int make_cimple_instance(const CMPIBroker* broker, const Meta_Class* meta_class, const CMPIObjectPath* op,
                         const CMPIInstance* inst, Instance*& out, unsigned depth)
{
    CMPIInstance_Container container(broker, meta_class->meta_repository, nullptr, writable(inst), depth);
    Ref<Instance> read(create(meta_class, false));
    Instance* instance = read.get();
    if (container.convert(meta_class, 0, instance) != 0) return 1;
    return finish(op, read, out);
}

int make_cimple_method(const CMPIBroker* broker, const Meta_Class* meta_class, const Meta_Method* method,
                       const CMPIObjectPath* op, const CMPIArgs* in, Instance*& out)
{
    CMPIArgs_Container container(broker, meta_class->meta_repository, nullptr, writable(in));
    Ref<Instance> read(create(method, false));
    Instance* record = read.get();
    if (container.convert(method, META_FLAG_IN, record) != 0) return 1;
    return finish(op, read, out);
}

int make_method_out(const CMPIBroker* broker, const char* name_space, const Instance* record, CMPIArgs* out,
                    Value& return_value)
{
    const Meta_Record* mm = record_of(record);
    assert(mm->num_meta_features > 0); // the last one is the return value
    CMPIArgs_Container container(broker, nullptr, name_space, out);
    if (container.convert(record, META_FLAG_OUT) != 0) return 1;
    return_value = container.return_value();
    return return_value.null() ? 1 : 0;
}

} // namespace cimple
