/// The module's exported entries, called as a server calls them.
///
/// Opening keeps the module loaded while the object lives. The module does not call back before a factory is called.
#pragma once

#include <string>

#include <cmpift.h>

namespace nvrtest {

class Entries {
public:
    /// Throws std::runtime_error if the module cannot be opened.
    Entries();
    ~Entries();
    Entries(const Entries&) = delete;
    Entries& operator=(const Entries&) = delete;

    void* handle() const { return m_handle; }

    // The record of a class's factory, or null.
    CMPIInstanceMI* instances(const std::string& class_name, const CMPIBroker* broker, const CMPIContext* context);
    CMPIMethodMI* methods(const std::string& class_name, const CMPIBroker* broker, const CMPIContext* context);
    CMPIAssociationMI* associations(const std::string& class_name, const CMPIBroker* broker,
                                    const CMPIContext* context);
    CMPIIndicationMI* indications(const std::string& class_name, const CMPIBroker* broker, const CMPIContext* context);

private:
    template <class Record>
    Record* call(const std::string& name, const CMPIBroker* broker, const CMPIContext* context);

    void* m_handle;
};

} // namespace nvrtest
