// The exported entries: that they are there, and what they hand to the bridge.
#include "tests/classes/Expected.h"
#include "tests/classes/fake/fake_adapter.h"

#include <gtest/gtest.h>

#include <dlfcn.h>
#include <set>

using namespace cimple;
using expected::Mi_Kind;
using expected::mi_kinds;
using expected::rows;

namespace {

using Provider_Factory = void* (*)(const CMPIBroker*, const CMPIContext*);
using Class_Factory = void* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*);

template <class Factory>
Factory entry(const std::string& name)
{
    return reinterpret_cast<Factory>(dlsym(RTLD_DEFAULT, name.c_str()));
}

} // namespace

TEST(Entries, All746HandTheirProviderToTheBridge)
{
    int places[3] = {};
    const auto* broker = reinterpret_cast<const CMPIBroker*>(&places[0]);
    const auto* context = reinterpret_cast<const CMPIContext*>(&places[1]);
    int count = 0;
    std::set<MI_Table_Set*> tables;
    for (const auto& row : rows("providers.txt")) {
        for (const Mi_Kind& kind : mi_kinds(row[1])) {
            const std::string tail = std::string("_Create_") + kind.word + "MI";
            const auto by_provider = entry<Provider_Factory>(row[0] + "_Provider" + tail);
            const auto by_class = entry<Class_Factory>(row[0] + tail);
            ASSERT_NE(by_provider, nullptr) << row[0] << tail;
            ASSERT_NE(by_class, nullptr) << row[0] << tail;
            count += 2;

            CMPIStatus status = {CMPI_RC_ERR_FAILED, nullptr};
            void* first = by_class(broker, context, &status);
            EXPECT_EQ(status.rc, CMPI_RC_ERR_FAILED) << "the status is left as it was";
            EXPECT_EQ(status.msg, nullptr);
            fake::last_factory_call() = {};
            void* second = by_provider(broker, context);
            EXPECT_NE(first, nullptr);
            EXPECT_EQ(first, second) << row[0] << tail;

            const fake::Factory_Call& call = fake::last_factory_call();
            EXPECT_EQ(call.tag, 'C');
            EXPECT_EQ(call.kind, kind.letter);
            EXPECT_EQ(call.broker, broker);
            EXPECT_EQ(call.context, context);
            EXPECT_EQ(call.provider_name, row[0] + "_Provider");
            ASSERT_NE(call.registration, nullptr);
            EXPECT_EQ(call.registration->provider_name, row[0] + "_Provider");
            EXPECT_EQ(call.tables->magic, 0u);
            EXPECT_EQ(call.tables->adapter, nullptr);
            tables.insert(call.tables);
        }
    }
    EXPECT_EQ(count, 746);
    EXPECT_EQ(tables.size(), 141u) << "each provider has a table set of its own";
}

TEST(Entries, ClassesExportNoOtherKind)
{
    for (const auto& row : rows("providers.txt")) {
        std::set<std::string> words = {"Instance", "Method", "Association", "Indication", "Property"};
        for (const Mi_Kind& kind : mi_kinds(row[1]))
            words.erase(kind.word);
        for (const auto& word : words)
            EXPECT_EQ(entry<void*>(row[0] + "_Create_" + word + "MI"), nullptr) << row[0] << " " << word;
    }
}
