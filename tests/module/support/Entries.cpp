#include "tests/module/support/Entries.h"

#include <dlfcn.h>
#include <stdexcept>

namespace nvrtest {

Entries::Entries() : m_handle(dlopen(NVR_MODULE, RTLD_NOW | RTLD_LOCAL))
{
    if (!m_handle) throw std::runtime_error(dlerror());
}

Entries::~Entries()
{
    dlclose(m_handle);
}

template <class Record>
Record* Entries::call(const std::string& name, const CMPIBroker* broker, const CMPIContext* context)
{
    const auto factory = reinterpret_cast<Record* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*)>(
        dlsym(m_handle, name.c_str()));
    if (!factory) return nullptr;
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    return factory(broker, context, &status);
}

CMPIInstanceMI* Entries::instances(const std::string& class_name, const CMPIBroker* broker, const CMPIContext* context)
{
    return call<CMPIInstanceMI>(class_name + "_Create_InstanceMI", broker, context);
}

CMPIMethodMI* Entries::methods(const std::string& class_name, const CMPIBroker* broker, const CMPIContext* context)
{
    return call<CMPIMethodMI>(class_name + "_Create_MethodMI", broker, context);
}

CMPIAssociationMI* Entries::associations(const std::string& class_name, const CMPIBroker* broker,
                                         const CMPIContext* context)
{
    return call<CMPIAssociationMI>(class_name + "_Create_AssociationMI", broker, context);
}

CMPIIndicationMI* Entries::indications(const std::string& class_name, const CMPIBroker* broker,
                                       const CMPIContext* context)
{
    return call<CMPIIndicationMI>(class_name + "_Create_IndicationMI", broker, context);
}

} // namespace nvrtest
