#include "agent/Instance_Map.h"

#include <gmock/gmock.h>

#include <numeric>
#include <stdexcept>
#include <string>
#include <vector>

#include "classes/CIM_ComputerSystem.h"
#include "classes/CIM_FCPort.h"
#include "classes/IBMSD_ComputerSystem.h"
#include "classes/NVRHBA_DiagnosticCompletionRecord.h"
#include "classes/NVRHBA_DiagnosticServiceRecord.h"
#include "classes/NVRHBA_FCPort.h"
#include "classes/NVRHBA_FCPortSystemDevice.h"
#include "classes/NVRHBA_RecordAppliesToElement.h"

using namespace cimple;

namespace {

template <class T>
T* port(const char* id)
{
    T* made = create_as<T>(true);
    made->SystemCreationClassName.set("CIM_ComputerSystem");
    made->SystemName.set("host");
    made->CreationClassName.set("NVRHBA_FCPort");
    made->DeviceID.set(id);
    return made;
}

template <class T = CIM_ComputerSystem>
T* host(const char* name)
{
    T* made = create_as<T>(true);
    made->CreationClassName.set("CIM_ComputerSystem");
    made->Name.set(name);
    return made;
}

template <class Host>
NVRHBA_FCPortSystemDevice* device(Host* of, const char* id)
{
    auto* made = create_as<NVRHBA_FCPortSystemDevice>(true);
    made->GroupComponent = reinterpret_cast<CIM_ComputerSystem*>(of);
    made->PartComponent = port<NVRHBA_FCPort>(id);
    return made;
}

/// What a record tells of; the record is of class T.
template <class T>
NVRHBA_RecordAppliesToElement* applies(const std::string& id)
{
    T* record = create_as<T>(true);
    record->InstanceID.set(id.c_str());
    auto* made = create_as<NVRHBA_RecordAppliesToElement>(true);
    made->Antecedent = reinterpret_cast<CIM_RecordForLog*>(record);
    return made;
}

std::string id_of(const Instance* instance)
{
    return static_cast<const NVRHBA_FCPort*>(instance)->DeviceID.value.c_str();
}

bool collect(Instance* instance, int, void* data)
{
    static_cast<std::vector<std::string>*>(data)->push_back(id_of(instance));
    unref(instance);
    return true;
}

class InstanceMap : public ::testing::Test {
protected:
    Instance_Map map{&NVRHBA_FCPort::meta};

    void fill(int count)
    {
        for (int i = 0; i < count; i++)
            ASSERT_EQ(map.insert(port<NVRHBA_FCPort>(std::to_string(i).c_str())), i);
    }
    std::vector<std::string> ids()
    {
        std::vector<std::string> all;
        EXPECT_EQ(map.for_each({collect, &all}), 0);
        return all;
    }
};

} // namespace

TEST_F(InstanceMap, IsBornEmptyAndFindsNothing)
{
    const Ref<NVRHBA_FCPort> key(port<NVRHBA_FCPort>("1"));
    EXPECT_EQ(map.meta_class(), &NVRHBA_FCPort::meta);
    EXPECT_TRUE(map.empty());
    EXPECT_EQ(map.find(key.get()), -1);
    EXPECT_EQ(map.lookup(key.get()), nullptr);
    EXPECT_EQ(map.find(nullptr), -1);
}

TEST_F(InstanceMap, KeepsTheOrderOfInsertion)
{
    fill(40);
    const auto all = ids();
    ASSERT_EQ(all.size(), 40u);
    for (std::size_t i = 0; i < all.size(); i++)
        EXPECT_EQ(all[i], std::to_string(i));
}

TEST_F(InstanceMap, InsertRefusesAKnownKeyAndLeavesTheInstanceToItsCaller)
{
    fill(1);
    Ref<NVRHBA_FCPort> second(port<NVRHBA_FCPort>("0"));
    EXPECT_EQ(map.insert(second.get()), -1);
    EXPECT_EQ(map.size(), 1u);
    EXPECT_EQ(map.insert(nullptr), -1);
    EXPECT_NE(map[0], second.get());
}

TEST_F(InstanceMap, ComparesKeysWithTheirCaseAndNotOtherProperties)
{
    ASSERT_EQ(map.insert(port<NVRHBA_FCPort>("10000000C9")), 0);
    EXPECT_EQ(map.insert(port<NVRHBA_FCPort>("10000000c9")), 1);
    Ref<NVRHBA_FCPort> other(port<NVRHBA_FCPort>("10000000C9"));
    other->ElementName.set("another");
    EXPECT_EQ(map.find(other.get()), 0);
}

TEST_F(InstanceMap, ANullKeyIsAnotherKeyThanAnEmptyOne)
{
    Ref<NVRHBA_FCPort> none(port<NVRHBA_FCPort>(""));
    none->DeviceID.null = 1;
    ASSERT_EQ(map.insert(port<NVRHBA_FCPort>("")), 0);
    EXPECT_EQ(map.find(none.get()), -1);
}

TEST_F(InstanceMap, FindsThroughAModelOfABaseClass)
{
    fill(40);
    const Ref<CIM_FCPort> model(port<CIM_FCPort>("33"));
    EXPECT_EQ(map.find(model.get()), 33);
}

TEST_F(InstanceMap, CreateAppendsACloneOrAnswers80)
{
    const Ref<NVRHBA_FCPort> source(port<NVRHBA_FCPort>("7"));
    EXPECT_EQ(map.create(source.get()), 0);
    EXPECT_NE(map[0], source.get());
    EXPECT_EQ(map.create(source.get()), 80);
    EXPECT_EQ(map.size(), 1u);
}

TEST_F(InstanceMap, GetGivesACloneOrAnswers60)
{
    fill(2);
    const Ref<NVRHBA_FCPort> key(port<NVRHBA_FCPort>("1"));
    Instance* found = nullptr;
    ASSERT_EQ(map.get(key.get(), found), 0);
    EXPECT_NE(found, map[1]);
    EXPECT_EQ(id_of(found), "1");
    unref(found);
    const Ref<NVRHBA_FCPort> unknown(port<NVRHBA_FCPort>("9"));
    EXPECT_EQ(map.get(unknown.get(), found), 60);
}

TEST_F(InstanceMap, ModifyCopiesWhatTheModelHasOrAnswers100)
{
    fill(1);
    const Ref<NVRHBA_FCPort> model(port<NVRHBA_FCPort>("0"));
    const Ref<NVRHBA_FCPort> wanted(port<NVRHBA_FCPort>("0"));
    model->Description.null = 0;
    wanted->Description.set("new");
    wanted->ElementName.set("not asked for");
    ASSERT_EQ(map.modify(model.get(), wanted.get()), 0);
    const auto* stored = static_cast<NVRHBA_FCPort*>(map[0]);
    EXPECT_EQ(stored->Description.value, "new");
    EXPECT_EQ(stored->Description.null, 0);
    EXPECT_EQ(stored->ElementName.null, 1);
    const Ref<NVRHBA_FCPort> unknown(port<NVRHBA_FCPort>("9"));
    EXPECT_EQ(map.modify(model.get(), unknown.get()), 100);
}

TEST_F(InstanceMap, RemoveClosesTheGapOrAnswers90)
{
    fill(20);
    const Ref<NVRHBA_FCPort> key(port<NVRHBA_FCPort>("3"));
    EXPECT_EQ(map.remove(key.get()), 0);
    EXPECT_EQ(map.remove(key.get()), 90);
    EXPECT_EQ(map.size(), 19u);
    for (int i = 4; i < 20; i++) {
        const Ref<NVRHBA_FCPort> behind(port<NVRHBA_FCPort>(std::to_string(i).c_str()));
        EXPECT_EQ(map.find(behind.get()), i - 1);
    }
    EXPECT_EQ(map.insert(port<NVRHBA_FCPort>("3")), 19);
}

TEST_F(InstanceMap, RemoveAtGivesTheElementUpWithoutDestroyingIt)
{
    fill(3);
    const Ref<Instance> taken(map[1]);
    map.remove_at(1);
    EXPECT_EQ(id_of(taken.get()), "1");
    EXPECT_EQ(ids(), (std::vector<std::string>{"0", "2"}));
    map.remove_at(2);
    map.remove_at(1000);
    EXPECT_EQ(map.size(), 2u);
}

TEST_F(InstanceMap, ClearEmptiesItForNewInstances)
{
    fill(30);
    map.clear();
    EXPECT_TRUE(map.empty());
    fill(30);
    EXPECT_EQ(map.size(), 30u);
}

TEST_F(InstanceMap, SwapExchangesElementsAndWhatFindsThem)
{
    fill(3);
    Instance_Map other(map.meta_class());
    ASSERT_EQ(other.insert(port<NVRHBA_FCPort>("another")), 0);
    map.swap(other);
    EXPECT_EQ(map.size(), 1u);
    EXPECT_EQ(other.size(), 3u);
    const Ref<Instance> key(port<NVRHBA_FCPort>("another"));
    EXPECT_EQ(map.find(key.get()), 0);
    EXPECT_EQ(other.find(key.get()), -1);
    const Ref<Instance> last(port<NVRHBA_FCPort>("2"));
    EXPECT_EQ(other.find(last.get()), 2);
}

TEST_F(InstanceMap, HandOverGivesTheElementsThemselves)
{
    fill(3);
    const Instance* first = map[0];
    std::vector<const Instance*> seen;
    map.hand_over({[](Instance* instance, int status, void* data) {
                       EXPECT_EQ(status, 0);
                       static_cast<std::vector<const Instance*>*>(data)->push_back(instance);
                       unref(instance);
                       return false;
                   },
                   &seen});
    EXPECT_EQ(seen.size(), 3u);
    EXPECT_EQ(seen[0], first);
    EXPECT_TRUE(map.empty());
}

TEST_F(InstanceMap, AHandlerThatThrowsLosesNoElement)
{
    fill(3);
    int calls = 0;
    const Enum_Handler handler{[](Instance* instance, int, void* data) -> bool {
                                   unref(instance);
                                   if (++*static_cast<int*>(data) == 2) throw std::runtime_error("handler");
                                   return true;
                               },
                               &calls};
    EXPECT_THROW(map.hand_over(handler), std::runtime_error);
    EXPECT_EQ(calls, 2);
    EXPECT_TRUE(map.empty()); // a leak of the third would be the sanitizer's finding
}

TEST_F(InstanceMap, FindsEachOfManyAndRefusesEachAgain)
{
    fill(3000);
    for (int i = 0; i < 3000; i++) {
        const Ref<NVRHBA_FCPort> key(port<NVRHBA_FCPort>(std::to_string(i).c_str()));
        ASSERT_EQ(map.find(key.get()), i);
        ASSERT_EQ(map.insert(key.get()), -1);
    }
}

TEST_F(InstanceMap, FindsEachOfManyThatAreLeftWhateverWasRemoved)
{
    constexpr int count = 500;
    fill(count);
    std::vector<int> left(count);
    std::iota(left.begin(), left.end(), 0);
    for (std::size_t next = 0; left.size() > 20; next = next * 31 + 17) {
        const std::size_t at = next % left.size();
        const Ref<NVRHBA_FCPort> key(port<NVRHBA_FCPort>(std::to_string(left[at]).c_str()));
        ASSERT_EQ(map.remove(key.get()), 0);
        ASSERT_EQ(map.find(key.get()), -1);
        left.erase(left.begin() + static_cast<std::ptrdiff_t>(at));
        for (std::size_t i = 0; i < left.size(); i += 7) {
            const Ref<NVRHBA_FCPort> kept(port<NVRHBA_FCPort>(std::to_string(left[i]).c_str()));
            ASSERT_EQ(map.find(kept.get()), static_cast<int>(i));
        }
    }
}

TEST(AssociationMap, ComparesTheKeysOfBothEnds)
{
    Instance_Map map(&NVRHBA_FCPortSystemDevice::meta);
    ASSERT_EQ(map.insert(device(host("a"), "1")), 0);
    ASSERT_EQ(map.insert(device(host("b"), "1")), 1);
    ASSERT_EQ(map.insert(device(host("a"), "2")), 2);
    const Ref<Instance> again(device(host("b"), "1"));
    EXPECT_EQ(map.find(again.get()), 1);
    EXPECT_EQ(map.insert(again.get()), -1);
}

TEST(AssociationMap, FindsEndsOfADerivedClassAndOfItsBase)
{
    Instance_Map map(&NVRHBA_FCPortSystemDevice::meta);
    for (int i = 0; i < 20; i++)
        ASSERT_EQ(map.insert(device(host("a"), std::to_string(i).c_str())), i);
    const Ref<Instance> foreign(device(host<IBMSD_ComputerSystem>("a"), "5"));
    EXPECT_EQ(map.find(foreign.get()), 5);
    const Ref<Instance> stranger(device(host<IBMSD_ComputerSystem>("b"), "5"));
    ASSERT_EQ(map.insert(Ref<Instance>(stranger).release()), 20);
    const Ref<Instance> usual(device(host("b"), "5"));
    EXPECT_EQ(map.find(usual.get()), 20);
    EXPECT_EQ(map.remove(usual.get()), 0);
    EXPECT_EQ(map.find(usual.get()), -1);
}

// Records of several classes have the key of their common superclass.
TEST(AssociationMap, FindsEndsOfClassesThatShareTheirKeys)
{
    Instance_Map map(&NVRHBA_RecordAppliesToElement::meta);
    for (int i = 0; i < 300; i++) {
        const std::string id = std::to_string(i);
        ASSERT_EQ(map.insert(i % 2 ? applies<NVRHBA_DiagnosticServiceRecord>(id)
                                   : applies<NVRHBA_DiagnosticCompletionRecord>(id)),
                  i);
    }
    for (int i = 0; i < 300; i++) {
        // The other class's instance with the same key is the same to key_eq.
        const Ref<Instance> key(applies<NVRHBA_DiagnosticServiceRecord>(std::to_string(i)));
        EXPECT_EQ(map.find(key.get()), i);
    }
}

TEST(AssociationMap, TwoNullEndsAgreeAndOneDoesNot)
{
    Instance_Map map(&NVRHBA_FCPortSystemDevice::meta);
    ASSERT_EQ(map.insert(device<CIM_ComputerSystem>(nullptr, "1")), 0);
    const Ref<Instance> same(device<CIM_ComputerSystem>(nullptr, "1"));
    const Ref<Instance> other(device(host("a"), "1"));
    EXPECT_EQ(map.find(same.get()), 0);
    EXPECT_EQ(map.find(other.get()), -1);
}
