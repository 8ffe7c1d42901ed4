/// Fixtures of the bridge's tests: one provider behind a fake broker; and the runtime log as lines.
#pragma once

#include <gmock/gmock.h>

#include "cmpi/CMPI_Adapter.h"
#include "tests/cmpi/fake_broker.h"
#include "tests/cmpi/test_classes.h"

namespace cimple {

/// Turns the runtime log on, in a folder of its own, before anything logs. Each test runs in a process of its own.
class Runtime_Log {
public:
    Runtime_Log();
    ~Runtime_Log();
    /// What was logged so far: "LEVEL message" without time and place.
    std::vector<std::string> lines() const;
    bool has(const std::string& line) const;

private:
    std::string m_folder;
};

/// A table set of a provider, its MI records, and the end of both.
class Bridge_Test : public testing::Test {
protected:
    explicit Bridge_Test(const Meta_Class* meta_class = &TEST_Thing::meta) : provider(meta_class) {}
    ~Bridge_Test() override;

    /// One factory call.
    void* create(char kind);
    CMPIInstanceMI* instance_mi() { return static_cast<CMPIInstanceMI*>(create('I')); }
    CMPIMethodMI* method_mi() { return static_cast<CMPIMethodMI*>(create('M')); }
    CMPIAssociationMI* association_mi() { return static_cast<CMPIAssociationMI*>(create('A')); }
    CMPIIndicationMI* indication_mi() { return static_cast<CMPIIndicationMI*>(create('N')); }

    CMPIrc clean(bool terminating = false);

    static fake::Path class_path(const char* name = "TEST_Thing") { return {"root/test", name, {}}; }
    static fake::Path thing_path(const char* name, unsigned number)
    {
        return {"root/test", "TEST_Thing", {{"Name", fake::string(name)}, {"Number", fake::uint8(number)}}};
    }
    static fake::Path part_path(const char* id) { return {"root/test", "TEST_Part", {{"Id", fake::string(id)}}}; }

    fake::Broker::Returned& returned() { return broker.returned(result); }

    fake::Broker broker;
    Test_Provider provider;
    MI_Table_Set tables{};
    CMPIContext* context = broker.context({{"CMPIPrincipal", fake::string("tester")}});
    CMPIResult* result = broker.result();
    /// Objects that stay with the broker until the request ends: elements of arrays, embedded instances.
    int elements_left = 0;
};

} // namespace cimple
