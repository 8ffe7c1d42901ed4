// The procs of all providers over fakes: which codes each kind has, and what comes back.
#include "tests/classes/Proc.h"

#include "classes/CIM_ConcreteJob.h"
#include "classes/NVRHBA_BootBIOSService.h"
#include "classes/NVRHBA_DumpService.h"
#include "classes/NVRHBA_FCHBADriverParamService.h"
#include "classes/NVRHBA_RecordLog.h"
#include "tests/classes/Expected.h"
#include "tests/classes/fake/Fake_Provider.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <set>

using namespace cimple;
using expected::rows;
using fake::Script;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

namespace {

Script& script()
{
    return Script::current();
}

/// Begins each test with a fresh script.
class Scripted : public ::testing::Test {
protected:
    Scripted() { script() = {}; }
};
class Procs : public Scripted {};
class Enumeration : public Scripted {};
class Associations : public Scripted {};
class Indications : public Scripted {};
class Methods : public Scripted {};

/// A record for a call of a class's method, found without case as the bridge finds it.
Ref<> record_for(const Proc& proc, const std::string& method)
{
    const Meta_Feature* feature = find_feature(proc.meta_class(), method.c_str(), META_FLAG_METHOD);
    if (!feature) throw std::runtime_error("no method " + method);
    return Ref<>(create(as_method(feature), true));
}

std::vector<std::string> classes_of_kind(const std::string& kind)
{
    std::vector<std::string> names;
    for (const auto& row : rows("providers.txt"))
        if (row[1] == kind) names.push_back(row[0]);
    return names;
}

/// Codes that no provider has.
constexpr int unknown_codes[] = {-1, 17, 18, 100, 1 << 30};

} // namespace

TEST(ModuleTable, TheListHoldsAllProvidersLastOneFirst)
{
    const auto list = rows("providers.txt");
    ASSERT_EQ(list.size(), 141u);
    const Registration* at = cimple_module();
    for (auto row = list.rbegin(); row != list.rend(); ++row, at = at->next) {
        ASSERT_NE(at, nullptr);
        EXPECT_EQ(at->provider_name, (*row)[0] + "_Provider");
        EXPECT_STREQ(at->module_name, "norvane_fc_provider_Module");
        EXPECT_EQ(at->meta_class, find_meta_class(&the_repository, (*row)[0].c_str()));
    }
    EXPECT_EQ(at, nullptr);
    EXPECT_STREQ(cimple_module()->provider_name, "NVRHBA_JobElementSettingData_Provider");
}

TEST(ModuleTable, KindsAreThoseOfTheClassFlags)
{
    EXPECT_EQ(classes_of_kind("association").size(), 91u);
    EXPECT_EQ(classes_of_kind("plain").size(), 49u);
    EXPECT_THAT(classes_of_kind("indication"), ElementsAre("NVRHBA_AlertIndication"));
    for (const auto& row : rows("providers.txt")) {
        const uint32 flags = find_meta_class(&the_repository, row[0].c_str())->flags;
        const char* kind = flags & META_FLAG_ASSOCIATION  ? "association"
                           : flags & META_FLAG_INDICATION ? "indication"
                                                          : "plain";
        EXPECT_EQ(row[1], kind) << row[0];
    }
}

TEST_F(Procs, EachGivesItsRecords)
{
    for (const auto& row : rows("providers.txt")) {
        Proc proc(row[0]);
        const Meta_Class* meta_class = nullptr;
        EXPECT_EQ(proc.call(OP_GET_META_CLASS, &meta_class), 0);
        EXPECT_EQ(meta_class, find_meta_class(&the_repository, row[0].c_str()));
        const Meta_Repository* repository = nullptr;
        EXPECT_EQ(proc.call(OP_GET_REPOSITORY, &repository), 0);
        EXPECT_EQ(repository, &the_repository);
    }
}

TEST_F(Procs, EachOwnsTheLifeOfItsProvider)
{
    for (const auto& row : rows("providers.txt")) {
        script().calls.clear();
        {
            Proc proc(row[0]);
            EXPECT_EQ(script().living, 1) << row[0];
            EXPECT_EQ(proc.call(OP_LOAD, proc.provider()), 0);
            EXPECT_EQ(proc.call(OP_UNLOAD, proc.provider()), 0);
            EXPECT_EQ(proc.call(OP_DESTROY_PROVIDER, nullptr), 0);
            EXPECT_EQ(script().living, 1) << row[0];
        }
        EXPECT_EQ(script().living, 0) << row[0];
        EXPECT_THAT(script().calls, ElementsAre(row[0] + ".load", row[0] + ".unload"));
    }
}

TEST_F(Procs, CodesOutsideAKindAreRefusedWithoutReachingTheProvider)
{
    for (const auto& row : rows("providers.txt")) {
        Proc proc(row[0]);
        script().calls.clear();
        Handled handled;
        std::set<int> refused(std::begin(unknown_codes), std::end(unknown_codes));
        if (row[1] == "plain") refused.insert({11, 12, 14, 15, 16});
        if (row[1] == "association") refused.insert({10, 11, 12});
        if (row[1] == "indication") refused.insert({5, 6, 7, 8, 9, 10, 14, 15, 16});
        Ref<> any_call(create(&CIM_Job_KillJob_method::meta, true));
        for (const int code : refused)
            EXPECT_EQ(proc.call(code, proc.provider(), nullptr, any_call.get(), nullptr, handled.proc(), &handled), -1)
                << row[0] << " " << code;
        EXPECT_THAT(script().calls, IsEmpty()) << row[0];
        EXPECT_THAT(handled.statuses, IsEmpty()) << row[0];
    }
}

TEST_F(Procs, InstanceOperationsReachTheProvider)
{
    for (const auto& row : rows("providers.txt")) {
        if (row[1] == "indication") continue;
        Proc proc(row[0]);
        script().calls.clear();
        Instance* found = reinterpret_cast<Instance*>(&found);
        EXPECT_EQ(proc.call(OP_GET_INSTANCE, proc.provider(), nullptr, &found), GET_INSTANCE_UNSUPPORTED);
        EXPECT_EQ(found, nullptr);
        EXPECT_EQ(proc.call(OP_CREATE_INSTANCE, proc.provider()), CREATE_INSTANCE_UNSUPPORTED);
        EXPECT_EQ(proc.call(OP_DELETE_INSTANCE, proc.provider()), DELETE_INSTANCE_UNSUPPORTED);
        EXPECT_EQ(proc.call(OP_MODIFY_INSTANCE, proc.provider()), MODIFY_INSTANCE_UNSUPPORTED);
        EXPECT_THAT(script().calls, ElementsAre(row[0] + ".get_instance", row[0] + ".create_instance",
                                                row[0] + ".delete_instance", row[0] + ".modify_instance"));
    }
}

TEST_F(Enumeration, AnEmptyOneIsClosedOnce)
{
    for (const auto& row : rows("providers.txt")) {
        if (row[1] == "indication") continue;
        Handled handled;
        EXPECT_EQ(Proc(row[0]).enumerate(handled), 0);
        EXPECT_THAT(handled.statuses, ElementsAre(0)) << row[0];
        EXPECT_EQ(handled.closings, 1) << row[0];
    }
}

TEST_F(Enumeration, TheClosingCallFollowsTheInstancesWithTheStatus)
{
    script().instances = 3;
    for (const int status : {0, 70, 71, 99}) {
        script().enum_status = status;
        Handled handled;
        EXPECT_EQ(Proc("NVRHBA_FCPort").enumerate(handled), status);
        EXPECT_THAT(handled.statuses, ElementsAre(0, 0, 0, status));
        EXPECT_EQ(handled.closings, 1);
    }
}

namespace {

/// One of the three association operations.
struct Traversal {
    int code;
    int Script::*status;
    int unsupported;
    const char* call;
};
constexpr Traversal traversals[] = {
    {OP_ENUM_ASSOCIATOR_NAMES, &Script::names_status, 111, "enum_associator_names result role other"},
    {OP_ENUM_REFERENCES, &Script::references_status, 121, "enum_references role"},
    {OP_ENUM_ASSOCIATORS, &Script::associators_status, 171, "enum_associators"},
};

int traverse(const Proc& proc, int code, Handled& handled)
{
    String result("result");
    String role("role");
    String other("other");
    if (code == OP_ENUM_REFERENCES)
        return proc.call(code, proc.provider(), nullptr, nullptr, &role, handled.proc(), &handled);
    return proc.call(code, proc.provider(), nullptr, &result, &role, &other, handled.proc(), &handled);
}

} // namespace

TEST_F(Associations, UnsupportedGoesBackWithoutAClosingCall)
{
    for (const auto& name : classes_of_kind("association")) {
        Proc proc(name);
        for (const Traversal& traversal : traversals) {
            Handled handled;
            script().calls.clear();
            EXPECT_EQ(traverse(proc, traversal.code, handled), traversal.unsupported) << name;
            EXPECT_THAT(handled.statuses, IsEmpty()) << name;
            EXPECT_THAT(script().calls, ElementsAre(name + "." + traversal.call));
        }
    }
}

TEST_F(Associations, AnyOtherStatusIsClosedOnce)
{
    for (const Traversal& traversal : traversals)
        for (const int status : {0, traversal.unsupported - 1, traversal.unsupported + 1}) {
            script().*traversal.status = status;
            Handled handled;
            EXPECT_EQ(traverse(Proc("NVRHBA_ControlledBy"), traversal.code, handled), status);
            EXPECT_THAT(handled.statuses, ElementsAre(status));
            EXPECT_EQ(handled.closings, 1);
        }
}

TEST_F(Indications, TheHandlerIsMadeForTheProviderAndKept)
{
    struct Sink {
        static bool take(Instance*, void* data) { return ++*static_cast<int*>(data) > 0; }
    };
    int taken = 0;
    Proc proc("NVRHBA_AlertIndication");
    EXPECT_EQ(proc.call(OP_ENABLE_INDICATIONS, proc.provider(), reinterpret_cast<void*>(&Sink::take), &taken), 0);
    ASSERT_NE(script().indications, nullptr);
    EXPECT_TRUE(script().indications->handle(nullptr));
    EXPECT_EQ(taken, 1);
    EXPECT_EQ(proc.call(OP_DISABLE_INDICATIONS, proc.provider()), 0);
    EXPECT_EQ(script().indications, nullptr);
}

TEST_F(Methods, EveryMethodOfAClassReachesItsMember)
{
    // What the fakes serve themselves; all else is answered by the classes' bases.
    const std::set<std::string> failing = {"NVRHBA_FCHBAWWNService.ChangeWWN"};
    std::set<std::string> served;
    for (const auto& row : rows("chains.txt")) {
        Proc proc(row[0]);
        for (std::size_t i = 1; i < row.size(); ++i) {
            if (row[i] == "|") continue;
            script().calls.clear();
            const Ref<> record = record_for(proc, row[i]);
            const int status = proc.invoke(record.get());
            const std::string name = row[0] + "." + row[i];
            if (script().calls.empty()) {
                EXPECT_EQ(status, INVOKE_METHOD_UNSUPPORTED) << name;
            } else {
                EXPECT_EQ(script().calls[0].substr(0, name.size()), name);
                EXPECT_EQ(status, failing.count(name) ? INVOKE_METHOD_FAILED : INVOKE_METHOD_OK) << name;
                served.insert(name);
            }
        }
    }
    // At least what the classes declare themselves cannot be left to a base.
    for (const auto& row : rows("methods.txt")) {
        const Meta_Class* owner = find_meta_class(&the_repository, row[0].c_str());
        const Meta_Feature* method = find_feature(owner, row[1].c_str(), META_FLAG_METHOD);
        if (find_feature(owner->super_meta_class, row[1].c_str(), META_FLAG_METHOD) == method) continue;
        EXPECT_TRUE(served.count(row[0] + "." + row[1])) << row[0] << "." << row[1];
    }
}

TEST_F(Methods, ANameInAnotherCaseIsTheSameMethod)
{
    Proc proc("NVRHBA_DumpService");
    EXPECT_EQ(proc.invoke(record_for(proc, "gENERATEdUMP").get()), 0);
    EXPECT_THAT(script().calls, ElementsAre("NVRHBA_DumpService.GenerateDump"));
}

TEST_F(Methods, AMethodOfAnotherShapeIsRefusedAndItsRecordUntouched)
{
    // The same name, declared by another class with other parameters.
    Proc proc("NVRHBA_RecordLog");
    Ref<> record(create(&CIM_ConcreteJob_RequestStateChange_method::meta, true));
    const Ref<> before(create(&CIM_ConcreteJob_RequestStateChange_method::meta, true));
    EXPECT_EQ(proc.invoke(record.get()), -1);
    EXPECT_THAT(script().calls, IsEmpty());
    const auto& call = static_cast<const CIM_ConcreteJob_RequestStateChange_method&>(*record);
    EXPECT_EQ(call.return_value.null, 1);
    EXPECT_EQ(call.RequestedState.null, 1);
}

TEST_F(Methods, AnUnknownNameIsRefused)
{
    Proc proc("NVRHBA_FCPort");
    EXPECT_EQ(proc.invoke(Ref<>(create(&NVRHBA_DumpService_DeleteDump_method::meta, true)).get()), -1);
    EXPECT_EQ(Proc("NVRHBA_Product").call(OP_INVOKE_METHOD, nullptr, nullptr, nullptr), -1);
}

TEST_F(Methods, ArgumentsAndResultsAreTheFieldsOfTheRecord)
{
    Proc service("NVRHBA_FCHBADriverParamService");
    const Ref<> set = record_for(service, "SetDriverParameter");
    auto& call = static_cast<NVRHBA_FCHBADriverParamService_SetDriverParameter_method&>(*set);
    call.bPermanent.set(true);
    call.bGlobal.set(false);
    call.strParam.set("lun_queue_depth");
    call.strValue.set("64");
    EXPECT_EQ(service.invoke(set.get()), 0);
    EXPECT_THAT(script().calls,
                ElementsAre("NVRHBA_FCHBADriverParamService.SetDriverParameter permanent lun_queue_depth=64"));
    EXPECT_EQ(call.return_value.value, 40000u);
    EXPECT_EQ(call.return_value.null, 0);

    Proc bios("NVRHBA_BootBIOSService");
    const Ref<> get = record_for(bios, "GetBootBIOSStatus");
    EXPECT_EQ(bios.invoke(get.get()), 0);
    const auto& status = static_cast<NVRHBA_BootBIOSService_GetBootBIOSStatus_method&>(*get);
    EXPECT_EQ(status.nBootBIOSStatus.value, 7u);
    EXPECT_EQ(status.nBootBIOSStatus.null, 0);

    Proc dump("NVRHBA_DumpService");
    const Ref<> names = record_for(dump, "GetDumpFileNames");
    EXPECT_EQ(dump.invoke(names.get()), 0);
    const auto& files = static_cast<NVRHBA_DumpService_GetDumpFileNames_method&>(*names).DumpFiles;
    ASSERT_EQ(files.value.size(), 1u);
    EXPECT_EQ(files.value[0], "dump.1");
}

TEST_F(Methods, ThreeServicesCanBeStarted)
{
    for (const char* name :
         {"NVRHBA_SoftwareInstallationService", "NVRHBA_BootBIOSService", "NVRHBA_FCHBADriverParamService"}) {
        Proc proc(name);
        const Ref<> record = record_for(proc, "StartService");
        EXPECT_EQ(proc.invoke(record.get()), 0) << name;
        const auto& result = static_cast<CIM_Service_StartService_method&>(*record).return_value;
        EXPECT_EQ(result.null, 0) << name;
        EXPECT_EQ(result.value, 0u) << name;
    }
    Proc other("NVRHBA_DumpService");
    const Ref<> record = record_for(other, "StartService");
    EXPECT_EQ(other.invoke(record.get()), INVOKE_METHOD_UNSUPPORTED);
    EXPECT_EQ(static_cast<CIM_Service_StartService_method&>(*record).return_value.null, 1);
}
