// A server may leave any slot, and whole tables, null: every operation with every slot absent in turn.
#include "runtime/Thread.h"
#include "runtime/cimom.h"
#include "tests/cmpi/Bridge_Test.h"

namespace cimple {
namespace {

class AbsentSlots : public Bridge_Test {
protected:
    AbsentSlots()
    {
        provider.instances = [] {
            auto* thing = new_thing("one", 1);
            thing->Text.set(String("t\x02"));
            thing->When.set(Datetime(uint64(1)));
            thing->Codes.value.append(1);
            thing->Codes.null = 0;
            thing->Other = new_part("p");
            return std::vector<Instance*>{thing};
        };
        provider.on[OP_CREATE_INSTANCE] = provider.on[OP_MODIFY_INSTANCE] = [](void**) { return 0; };
        provider.on[OP_INVOKE_METHOD] = [](void** words) {
            up_calls();
            auto* call = static_cast<TEST_Thing_Echo*>(words[2]);
            call->Reply.set(String("r"));
            call->return_value.set<uint32>(0);
            return 0;
        };
        provider.on[OP_ENABLE_INDICATIONS] = [this](void** words) {
            handler = {reinterpret_cast<Indication_Handler_Proc>(words[1]), words[2]};
            return 0;
        };
        provider.on[OP_DISABLE_INDICATIONS] = [this](void**) {
            handler.handle(create_as<TEST_Event>());
            return 0;
        };
    }

    static void up_calls()
    {
        Ref<TEST_Part> model(new_part("p"));
        {
            Instance_Enumerator enumerator;
            cimom::enum_instances("root/far", model.get(), enumerator);
            enumerator.next();
        }
        unref(cimom::get_instance("root/far", model.get()));
        cimom::create_instance("root/far", model.get());
        cimom::modify_instance("root/far", model.get());
        cimom::delete_instance("root/far", model.get());
        Ref<TEST_Thing> target(new_thing("t", 1));
        Ref<Instance> call(cimple::create(&TEST_Thing_Echo::meta, true));
        cimom::invoke_method("root/far", target.get(), call.get());
        String name;
        cimom::get_username(name);
        Thread thread;
        if (Thread::create_joinable(
                thread, [](void*) -> void* { return nullptr; }, nullptr) == 0) {
            void* result = nullptr;
            Thread::join(thread, result);
        }
    }

    /// Everything once; results are not looked at.
    void everything()
    {
        auto* instance = instance_mi();
        auto* method = method_mi();
        auto* association = association_mi();
        auto* indication = indication_mi();
        const char* list[] = {"Text", nullptr};
        const fake::Path where = thing_path("one", 1);
        CMPIObjectPath* path = broker.path(where);
        CMPIInstance* sent = broker.instance({where,
                                              {{"Text", fake::string("x")},
                                               {"When", fake::datetime("00000000000500.000000:000")},
                                               {"Words", fake::array(CMPI_string, {fake::string("a")})},
                                               {"Other", fake::reference(part_path("p"))},
                                               {"Part", fake::embedded({part_path("p"), {}})}}});
        instance->ft->enumerateInstanceNames(instance, context, result, path);
        instance->ft->enumerateInstances(instance, context, result, path, list);
        instance->ft->getInstance(instance, context, result, path, list);
        instance->ft->createInstance(instance, context, result, path, sent);
        instance->ft->modifyInstance(instance, context, result, path, sent, list);
        instance->ft->deleteInstance(instance, context, result, path);
        instance->ft->execQuery(instance, context, result, path, "", "");
        method->ft->invokeMethod(method, context, result, path, "Echo",
                                 broker.args({{"Text", fake::string("x")}, {"Number", fake::string("1")}}),
                                 broker.args());
        association->ft->associators(association, context, result, path, "", "", "", "", list);
        association->ft->associatorNames(association, context, result, path, "", "", "", "");
        association->ft->references(association, context, result, path, "", "", list);
        association->ft->referenceNames(association, context, result, path, "", "");
        indication->ft->activateFilter(indication, context, nullptr, "", path, 1);
        indication->ft->enableIndications(indication, context);
        indication->ft->disableIndications(indication, context);
        indication->ft->deActivateFilter(indication, context, nullptr, "", path, 1);
        for (int i = 0; i < 4; ++i)
            clean();
        EXPECT_EQ(tables.adapter, nullptr);
    }

    /// Takes each pointer of a table out in turn; tables are ints and then pointers.
    template <class Table>
    void without_each(Table& table)
    {
        auto* words = reinterpret_cast<void**>(&table);
        for (std::size_t i = 1; i < sizeof(Table) / sizeof(void*); ++i) {
            if (!words[i]) continue;
            void* slot = words[i];
            words[i] = nullptr;
            everything();
            words[i] = slot;
        }
    }

    Indication_Handler handler{};
};

TEST_F(AbsentSlots, NothingIsAbsent)
{
    everything();
    EXPECT_EQ(broker.deliveries.size(), 1u);
    EXPECT_EQ(returned().values.size(), 1u);
    EXPECT_EQ(broker.attached, broker.detached);
}

class AbsentSlotsOf : public AbsentSlots {
protected:
    ~AbsentSlotsOf() override { elements_left = broker.alive(); } // what had no release could not be given back
};

TEST_F(AbsentSlotsOf, Broker)
{
    without_each(broker.eft);
    without_each(broker.bft);
}

TEST_F(AbsentSlotsOf, Values)
{
    without_each(broker.string_ft);
    without_each(broker.datetime_ft);
    without_each(broker.array_ft);
    without_each(broker.enumeration_ft);
}

TEST_F(AbsentSlotsOf, Objects)
{
    without_each(broker.path_ft);
    without_each(broker.instance_ft);
    without_each(broker.args_ft);
}

TEST_F(AbsentSlotsOf, Requests)
{
    without_each(broker.result_ft);
    without_each(broker.context_ft);
}

TEST_F(AbsentSlotsOf, WholeTables)
{
    broker.cmpi.eft = nullptr;
    everything();
    broker.cmpi.bft = nullptr;
    everything();
    broker.cmpi.eft = &broker.eft;
    everything();
}

TEST_F(AbsentSlots, NoBrokerAndNoContextAtAll)
{
    void* made = nullptr;
    cimple_cmpi_adapter('C', &tables, &provider, nullptr, nullptr, nullptr, 'I', &made);
    auto* mi = static_cast<CMPIInstanceMI*>(made);
    ASSERT_NE(mi, nullptr);
    EXPECT_STREQ(mi->ft->miName, "instance");
    EXPECT_EQ(mi->ft->enumerateInstances(mi, nullptr, nullptr, nullptr, nullptr).rc, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(mi->ft->enumerateInstances(mi, nullptr, nullptr, broker.path(class_path()), nullptr).rc, CMPI_RC_OK);
}

} // namespace
} // namespace cimple
