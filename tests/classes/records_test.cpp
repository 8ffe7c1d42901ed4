// The generated records against the class reference.
#include "classes/CIM_ConcreteJob.h"
#include "classes/CIM_EnabledLogicalElement.h"
#include "classes/NVRHBA_DumpService.h"
#include "classes/NVRHBA_ElementSoftwareIdentity.h"
#include "classes/NVRHBA_FCPort.h"
#include "classes/NVRHBA_RecordLog.h"
#include "classes/NVRHBA_StorageVolume.h"
#include "classes/repository.h"
#include "tests/classes/Expected.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <map>
#include <set>

#pragma GCC diagnostic ignored "-Winvalid-offsetof"

using namespace cimple;
using expected::rows;

namespace {

const Meta_Class& class_named(const std::string& name)
{
    const Meta_Class* found = find_meta_class(&the_repository, name.c_str());
    if (!found) throw std::runtime_error("no class " + name);
    return *found;
}

std::vector<const Meta_Class*> all_classes()
{
    return {the_repository.meta_classes, the_repository.meta_classes + the_repository.num_meta_classes};
}

std::size_t position_of(const Meta_Record& record, const std::string& name)
{
    for (std::size_t i = 0; i < record.num_meta_features; ++i)
        if (name == record.meta_features[i]->name) return i;
    throw std::runtime_error("no feature " + name);
}

const Meta_Feature& feature_named(const Meta_Record& record, const std::string& name)
{
    return *record.meta_features[position_of(record, name)];
}

/// The type of a property as the lists spell it: "string[]".
std::string type_text(const Meta_Property& property)
{
    return std::string(type_names[property.type]) + (property.subscript ? "[]" : "");
}

/// A parameter as the lists spell it: "in+out:uint16:Format", "out:CIM_ConcreteJob&:Job".
std::string parameter_text(const Meta_Feature& parameter)
{
    std::string text = parameter.flags & META_FLAG_IN ? "in" : "";
    if (parameter.flags & META_FLAG_OUT) text += text.empty() ? "out" : "+out";
    text += ":";
    if (is_reference(&parameter)) {
        const Meta_Reference* reference = as_reference(&parameter);
        text += std::string(reference->meta_class->name) + (reference->subscript ? "[]" : "") + "&";
    } else {
        text += type_text(*as_property(&parameter));
    }
    return text + ":" + parameter.name;
}

/// Walks a record as a compiler lays out a structure: each member behind the last, aligned by itself.
struct Layout {
    std::size_t end = sizeof(Instance);

    std::size_t place(std::size_t size, std::size_t alignment)
    {
        const std::size_t offset = (end + alignment - 1) / alignment * alignment;
        end = offset + size;
        return offset;
    }
    /// The offset that the next feature must have.
    std::size_t place(const Meta_Feature* feature)
    {
        std::size_t size = sizeof(void*);
        const bool is_scalar_reference = is_reference(feature) && as_reference(feature)->subscript == 0;
        if (is_property(feature) && as_property(feature)->subscript == 0) size = type_sizes[as_property(feature)->type];
        return is_scalar_reference ? place(size, size) : place(2 * size, size);
    }
    std::size_t size() const { return (end + alignof(Instance) - 1) / alignof(Instance) * alignof(Instance); }
};

void expect_layout(const Meta_Record& record)
{
    Layout layout;
    for (std::size_t i = 0; i < record.num_meta_features; ++i) {
        const Meta_Feature* feature = record.meta_features[i];
        if (is_method(feature)) continue;
        const std::size_t offset = is_property(feature) ? as_property(feature)->offset : as_reference(feature)->offset;
        EXPECT_EQ(offset, layout.place(feature)) << record.name << "." << feature->name;
    }
    EXPECT_EQ(record.size, layout.size()) << record.name;
}

} // namespace

TEST(Records, AllClassesStandInTheirOrderWithTheirSuperclass)
{
    const auto list = rows("classes.txt");
    ASSERT_EQ(list.size(), 260u);
    ASSERT_EQ(the_repository.num_meta_classes, 260u);
    for (std::size_t i = 0; i < list.size(); ++i) {
        const Meta_Class* at = the_repository.meta_classes[i];
        EXPECT_EQ(at->name, list[i][0]);
        const Meta_Class* super = list[i].size() == 1 ? nullptr : &class_named(list[i][1]);
        EXPECT_EQ(at->super_meta_class, super) << at->name;
        EXPECT_EQ(at->meta_repository, &the_repository);
    }
}

TEST(Records, NoRecordIsCountedOrQualified)
{
    const auto expect_static = [](const Meta_Feature* feature) {
        EXPECT_EQ(feature->refs.load(), 0u) << feature->name;
        EXPECT_EQ(feature->meta_qualifiers, nullptr) << feature->name;
        EXPECT_EQ(feature->num_meta_qualifiers, 0u) << feature->name;
    };
    for (const Meta_Class* at : all_classes()) {
        expect_static(at);
        std::for_each(at->meta_features, at->meta_features + at->num_meta_features, expect_static);
    }
}

TEST(Records, ClassFlagsAreOfTheKnownMasks)
{
    const std::set<uint32> known = {0x8, 0x18, 0x8008, 0x80, 0x90, 0xC0, 0xD0, 0x8080, 0x80C0, 0x80000, 0x80010};
    std::map<uint32, int> counts;
    for (const Meta_Class* at : all_classes()) {
        EXPECT_TRUE(known.count(at->flags)) << at->name << " " << std::hex << at->flags;
        ++counts[at->flags];
    }
    // Every mask but that of an experimental aggregation, which the schema no longer has.
    for (const uint32 mask : known)
        EXPECT_EQ(counts.count(mask), mask == 0x80C0 ? 0u : 1u) << std::hex << mask;
}

TEST(Records, ASubclassIsOfItsSuperclassesKind)
{
    const uint32 kinds =
        META_FLAG_CLASS | META_FLAG_ASSOCIATION | META_FLAG_INDICATION | META_FLAG_AGGREGATION | META_FLAG_COMPOSITION;
    for (const Meta_Class* at : all_classes()) {
        // An association may be the first aggregation of its line, not the last.
        const uint32 inherited = at->super_meta_class ? at->super_meta_class->flags & kinds : 0u;
        EXPECT_EQ(at->flags & inherited, inherited) << at->name;
    }
}

TEST(Records, ANarrowedEndKeepsItsPartInTheAssociation)
{
    const uint32 parts = META_FLAG_AGGREGATE | META_FLAG_WEAK;
    for (const auto& row : rows("references.txt")) {
        const Meta_Class& owner = class_named(row[0]);
        const Meta_Feature& end = feature_named(owner, row[1]);
        EXPECT_EQ(end.flags & parts, feature_named(*owner.super_meta_class, row[1]).flags & parts) << row[0] << row[1];
    }
}

TEST(Records, KindsOfTheSchemasIndicationsAreAsPublished)
{
    EXPECT_EQ(class_named("CIM_Error").flags, META_FLAG_INDICATION);
    EXPECT_EQ(class_named("CIM_AlertIndication").flags, META_FLAG_INDICATION);
    EXPECT_EQ(class_named("CIM_ProcessIndication").flags, META_FLAG_INDICATION | META_FLAG_ABSTRACT);
    EXPECT_EQ(class_named("CIM_Indication").flags, META_FLAG_INDICATION | META_FLAG_ABSTRACT);
    EXPECT_EQ(class_named("NVRHBA_AlertIndication").flags, META_FLAG_INDICATION);
}

TEST(Records, EveryFeatureIsOfOneKind)
{
    for (const Meta_Class* at : all_classes())
        for (std::size_t i = 0; i < at->num_meta_features; ++i) {
            const Meta_Feature* feature = at->meta_features[i];
            EXPECT_EQ(is_property(feature) + is_reference(feature) + is_method(feature), 1)
                << at->name << "." << feature->name;
            EXPECT_TRUE(!is_property(feature) || as_property(feature)->type < number_of_types) << feature->name;
            EXPECT_TRUE(!is_reference(feature) || as_reference(feature)->meta_class) << feature->name;
        }
}

TEST(Records, InheritedFeaturesComeFirstAndAreShared)
{
    for (const Meta_Class* at : all_classes()) {
        const Meta_Class* super = at->super_meta_class;
        const std::size_t inherited = super ? super->num_meta_features : 0;
        ASSERT_GE(at->num_meta_features, inherited) << at->name;
        for (std::size_t i = 0; i < at->num_meta_features; ++i) {
            if (i < inherited) {
                EXPECT_TRUE(equali(at->meta_features[i]->name, super->meta_features[i]->name)) << at->name;
                EXPECT_EQ(at->locals[i] == 0, at->meta_features[i] == super->meta_features[i]) << at->name << " " << i;
            } else {
                EXPECT_EQ(at->locals[i], 1) << at->name << " " << i;
            }
        }
    }
}

TEST(Records, KeysAreCounted)
{
    for (const Meta_Class* at : all_classes()) {
        uint32 keys = 0;
        for (std::size_t i = 0; i < at->num_meta_features; ++i)
            if (is_key(at->meta_features[i])) ++keys;
        EXPECT_EQ(at->num_keys, keys) << at->name;
    }
}

TEST(Records, OffsetsAndSizesAreThoseOfTheStructures)
{
    for (const Meta_Class* at : all_classes()) {
        expect_layout(*at);
        for (std::size_t i = 0; i < at->num_meta_features; ++i)
            if (is_method(at->meta_features[i])) expect_layout(*as_method(at->meta_features[i]));
    }
    EXPECT_EQ(NVRHBA_FCPort::meta.size, sizeof(NVRHBA_FCPort));
    EXPECT_EQ(as_property(&feature_named(NVRHBA_FCPort::meta, "AdapterName"))->offset,
              offsetof(NVRHBA_FCPort, AdapterName));
    EXPECT_EQ(as_property(&feature_named(NVRHBA_FCPort::meta, "LocationIndicator"))->offset,
              offsetof(NVRHBA_FCPort, LocationIndicator));
    EXPECT_EQ(as_property(&feature_named(NVRHBA_FCPort::meta, "OperationalStatus"))->offset,
              offsetof(NVRHBA_FCPort, OperationalStatus));
    EXPECT_EQ(NVRHBA_StorageVolume::meta.size, sizeof(NVRHBA_StorageVolume));
    EXPECT_EQ(as_property(&feature_named(NVRHBA_StorageVolume::meta, "DeviceType"))->offset,
              offsetof(NVRHBA_StorageVolume, DeviceType));
    EXPECT_EQ(as_reference(&feature_named(NVRHBA_ElementSoftwareIdentity::meta, "Dependent"))->offset,
              offsetof(NVRHBA_ElementSoftwareIdentity, Dependent));
    EXPECT_EQ(as_reference(&feature_named(CIM_ConcreteJob::meta, "JobInParameters"))->offset,
              offsetof(CIM_ConcreteJob, JobInParameters));
    EXPECT_EQ(NVRHBA_DumpService_GetDumpFileNames_method::meta.size,
              sizeof(NVRHBA_DumpService_GetDumpFileNames_method));
}

TEST(Records, OwnPropertiesAreDeclaredInTheirOrder)
{
    std::map<std::string, std::vector<std::string>> names;
    for (const auto& row : rows("properties.txt")) {
        const Meta_Class& owner = class_named(row[0]);
        const std::size_t position = position_of(owner, row[2]);
        const Meta_Property& property = *as_property(owner.meta_features[position]);
        ASSERT_TRUE(is_property(&property)) << row[0] << "." << row[2];
        EXPECT_EQ(type_text(property), row[1]) << row[0] << "." << row[2];
        EXPECT_EQ(owner.locals[position], 1) << row[0] << "." << row[2];
        const uint32 flags = META_FLAG_PROPERTY | (row.size() > 3 ? uint32{META_FLAG_WRITE} : 0u);
        EXPECT_EQ(property.flags, flags) << row[0] << "." << row[2];
        if (position >= owner.super_meta_class->num_meta_features) names[row[0]].push_back(row[2]);
    }
    ASSERT_EQ(rows("properties.txt").size(), 187u);
    // What is new stands behind the inherited features, in the order of the list; nothing else is declared but methods
    // and narrowed references.
    for (const auto& [name, list] : names) {
        const Meta_Class& owner = class_named(name);
        std::vector<std::string> declared;
        for (std::size_t i = owner.super_meta_class->num_meta_features; i < owner.num_meta_features; ++i)
            if (!is_method(owner.meta_features[i])) declared.push_back(owner.meta_features[i]->name);
        EXPECT_EQ(declared, list) << name;
    }
}

TEST(Records, AssociationsReferToTheirClasses)
{
    for (const auto& row : rows("references.txt")) {
        const Meta_Class& owner = class_named(row[0]);
        const Meta_Reference& reference = *as_reference(&feature_named(owner, row[1]));
        ASSERT_TRUE(is_reference(&reference)) << row[0] << "." << row[1];
        EXPECT_EQ(reference.meta_class, &class_named(row[2])) << row[0] << "." << row[1];
        EXPECT_TRUE(is_key(&reference)) << row[0] << "." << row[1];
        EXPECT_EQ(reference.subscript, 0);
        EXPECT_EQ(owner.locals[position_of(owner, row[1])], 1) << row[0] << "." << row[1];
    }
    EXPECT_EQ(rows("references.txt").size(), 185u);
}

TEST(Records, TheModulesClassesDeclareNothingElse)
{
    std::set<std::string> declared;
    for (const auto& row : rows("properties.txt"))
        declared.insert(row[0] + "." + row[2]);
    for (const auto& row : rows("references.txt"))
        declared.insert(row[0] + "." + row[1]);
    for (const auto& row : rows("methods.txt"))
        declared.insert(row[0] + "." + row[1]);
    for (const Meta_Class* at : all_classes()) {
        if (std::string(at->name).rfind("CIM_", 0) == 0) continue;
        for (std::size_t i = 0; i < at->num_meta_features; ++i) {
            if (!at->locals[i]) continue;
            EXPECT_TRUE(declared.count(std::string(at->name) + "." + at->meta_features[i]->name))
                << at->name << "." << at->meta_features[i]->name;
        }
    }
}

TEST(Records, SchemaClassesDeclareTheirKeys)
{
    std::map<std::string, std::set<std::string>> listed;
    for (const auto& row : rows("keys.txt"))
        listed[row[0]] = {row.begin() + 1, row.end()};
    for (const Meta_Class* at : all_classes()) {
        const auto list = listed.find(at->name);
        if (list != listed.end()) {
            for (const auto& name : list->second)
                EXPECT_TRUE(is_key(&feature_named(*at, name))) << at->name << "." << name;
        }
        // A key that no list names is inherited, or an end of an association.
        for (std::size_t i = 0; i < at->num_meta_features; ++i) {
            const Meta_Feature* feature = at->meta_features[i];
            if (!is_key(feature) || is_reference(feature)) continue;
            const Meta_Class* super = at->super_meta_class;
            const bool inherited = super && i < super->num_meta_features && is_key(super->meta_features[i]);
            EXPECT_TRUE(inherited || (list != listed.end() && list->second.count(feature->name)))
                << at->name << "." << feature->name;
        }
    }
}

TEST(Records, KeysOfAssociationsAreTheirTwoOrThreeReferences)
{
    int associations = 0;
    for (const Meta_Class* at : all_classes()) {
        if (!(at->flags & META_FLAG_ASSOCIATION)) continue;
        ++associations;
        EXPECT_TRUE(at->num_keys == 2 || at->num_keys == 3) << at->name;
        for (std::size_t i = 0; i < at->num_meta_features; ++i)
            EXPECT_EQ(is_key(at->meta_features[i]), is_reference(at->meta_features[i])) << at->name;
    }
    EXPECT_GT(associations, 91);
}

TEST(Records, ServedMethodsHaveTheirParametersInOrder)
{
    for (const auto& row : rows("methods.txt")) {
        const Meta_Feature* feature = find_feature(&class_named(row[0]), row[1].c_str(), META_FLAG_METHOD);
        ASSERT_NE(feature, nullptr) << row[0] << "." << row[1];
        const Meta_Method& method = *as_method(feature);
        EXPECT_EQ(type_names[method.return_type], row[2]);
        ASSERT_EQ(method.num_meta_features, row.size() - 2) << row[0] << "." << row[1];
        for (std::size_t i = 3; i < row.size(); ++i)
            EXPECT_EQ(parameter_text(*method.meta_features[i - 3]), row[i]) << row[0] << "." << row[1];
        const Meta_Feature* result = method.meta_features[method.num_meta_features - 1];
        EXPECT_STREQ(result->name, "return_value");
        EXPECT_EQ(result->flags, META_FLAG_PROPERTY | META_FLAG_OUT);
        EXPECT_EQ(as_property(result)->type, method.return_type);
    }
}

TEST(Records, MethodsOfTheModulesClassesAreThoseOfTheList)
{
    for (const auto& row : rows("chains.txt")) {
        std::set<std::string> listed(row.begin() + 1, row.end());
        listed.erase("|");
        std::set<std::string> found;
        const Meta_Class& owner = class_named(row[0]);
        for (std::size_t i = 0; i < owner.num_meta_features; ++i)
            if (is_method(owner.meta_features[i])) found.insert(owner.meta_features[i]->name);
        EXPECT_EQ(found, listed) << row[0];
    }
    EXPECT_EQ(rows("chains.txt").size(), 49u);
}

TEST(Records, NoAssociationHasAMethod)
{
    for (const Meta_Class* at : all_classes())
        for (std::size_t i = 0; i < at->num_meta_features; ++i)
            EXPECT_FALSE(at->flags & META_FLAG_ASSOCIATION && is_method(at->meta_features[i])) << at->name;
}

TEST(Records, DefaultsAreThoseOfTheSchema)
{
    const auto number = [](const Meta_Class& owner, const char* name) {
        return *static_cast<const uint16*>(as_property(&feature_named(owner, name))->value);
    };
    EXPECT_EQ(number(NVRHBA_FCPort::meta, "EnabledState"), 5);
    EXPECT_EQ(number(NVRHBA_FCPort::meta, "RequestedState"), 12);
    EXPECT_EQ(number(NVRHBA_FCPort::meta, "EnabledDefault"), 2);
    const auto* removal = as_property(&feature_named(CIM_ConcreteJob::meta, "TimeBeforeRemoval"));
    EXPECT_STREQ(*static_cast<const char* const*>(removal->value), "00000000000500.000000:000");
}

TEST(Records, ARestatedPropertyKeepsItsDefault)
{
    for (const char* name : {"NVRHBA_ElementDumpData", "NVRHBA_ElementVPD", "NVRHBA_DiagElementSettingData"})
        for (const char* property : {"IsMinimum", "IsMaximum", "IsPending"}) {
            const void* value = as_property(&feature_named(class_named(name), property))->value;
            ASSERT_NE(value, nullptr) << name << "." << property;
            EXPECT_EQ(*static_cast<const uint16*>(value), 0);
        }
    const void* value = as_property(&feature_named(class_named("CIM_ProtocolEndpoint"), "EnabledState"))->value;
    ASSERT_NE(value, nullptr);
    EXPECT_EQ(*static_cast<const uint16*>(value), 5);
}

TEST(Records, DefaultsStandOnScalarsOfSixTypesOnly)
{
    const std::set<uint16> types = {BOOLEAN, UINT16, UINT32, UINT64, STRING, DATETIME};
    for (const Meta_Class* at : all_classes())
        for (std::size_t i = 0; i < at->num_meta_features; ++i) {
            if (!is_property(at->meta_features[i])) continue;
            const Meta_Property* property = as_property(at->meta_features[i]);
            if (!property->value) continue;
            EXPECT_EQ(property->subscript, 0) << at->name << "." << property->name;
            EXPECT_TRUE(types.count(property->type)) << at->name << "." << property->name;
        }
}

TEST(Records, EmbeddedObjectsReferToTheRootAndEmbeddedInstancesToTheirClass)
{
    const Meta_Reference& in = *as_reference(&feature_named(CIM_ConcreteJob::meta, "JobInParameters"));
    EXPECT_EQ(in.flags, META_FLAG_REFERENCE | META_FLAG_EMBEDDED_OBJECT);
    EXPECT_EQ(in.meta_class, &Instance::meta);
    const Meta_Reference& settings =
        *as_reference(&feature_named(class_named("NVRHBA_DiagnosticSettingDataRecord"), "Settings"));
    EXPECT_EQ(settings.flags, META_FLAG_REFERENCE | META_FLAG_EMBEDDED_INSTANCE);
    EXPECT_EQ(settings.meta_class, &class_named("CIM_DiagnosticSettingData"));
    const Meta_Method& run =
        *as_method(&feature_named(class_named("NVRHBA_FCHBADiagnosticTest"), "RunDiagnosticService"));
    EXPECT_EQ(run.meta_features[1]->flags, META_FLAG_REFERENCE | META_FLAG_EMBEDDED_INSTANCE | META_FLAG_IN);
}

TEST(Records, QualifiersOfTheSchemaBecomeFlags)
{
    EXPECT_EQ(feature_named(class_named("CIM_EnabledLogicalElement"), "EnabledDefault").flags,
              META_FLAG_PROPERTY | META_FLAG_WRITE);
    EXPECT_EQ(feature_named(class_named("CIM_FCPortStatistics"), "CRCErrors").flags,
              META_FLAG_PROPERTY | META_FLAG_COUNTER);
    EXPECT_EQ(feature_named(class_named("CIM_Log"), "CurrentNumberOfRecords").flags,
              META_FLAG_PROPERTY | META_FLAG_GAUGE);
    EXPECT_EQ(feature_named(class_named("CIM_ConcreteJob"), "TimeBeforeRemoval").flags,
              META_FLAG_PROPERTY | META_FLAG_WRITE | META_FLAG_REQUIRED);
    EXPECT_EQ(feature_named(class_named("CIM_ManagedElement"), "Generation").flags,
              META_FLAG_PROPERTY | META_FLAG_EXPERIMENTAL);
    EXPECT_EQ(feature_named(class_named("CIM_SystemDevice"), "GroupComponent").flags,
              META_FLAG_REFERENCE | META_FLAG_KEY | META_FLAG_AGGREGATE);
    EXPECT_EQ(feature_named(class_named("CIM_SystemDevice"), "PartComponent").flags,
              META_FLAG_REFERENCE | META_FLAG_KEY | META_FLAG_WEAK);
    EXPECT_EQ(feature_named(class_named("CIM_ProtocolEndpoint"), "Name").flags, META_FLAG_PROPERTY | META_FLAG_KEY);
}

TEST(Records, AnInstanceOfEveryClassCanBeMadeCopiedAndFreed)
{
    for (const Meta_Class* at : all_classes()) {
        Ref<> made(create(at, true));
        Ref<> copied(clone(made.get()));
        EXPECT_TRUE(identical(made.get(), copied.get())) << at->name;
    }
}

TEST(Records, ACallOfEveryMethodCanBeMadeAndFreed)
{
    for (const Meta_Class* at : all_classes())
        for (std::size_t i = 0; i < at->num_meta_features; ++i)
            if (is_method(at->meta_features[i])) {
                Ref<> call(create(as_method(at->meta_features[i]), true));
                EXPECT_EQ(record_of(call.get()), as_method(at->meta_features[i]));
            }
}

TEST(Structures, MembersHaveTheTypesOfTheirFeatures)
{
    static_assert(std::is_same_v<decltype(NVRHBA_FCPort::LocationIndicator), Property<uint16>>);
    static_assert(std::is_same_v<decltype(NVRHBA_FCPort::OperationalStatus), Property<Array<uint16>>>);
    static_assert(std::is_same_v<decltype(NVRHBA_FCPort::DeviceID), Property<String>>);
    static_assert(std::is_same_v<decltype(NVRHBA_ElementSoftwareIdentity::Dependent), NVRHBA_PortController*>);
    static_assert(std::is_same_v<decltype(CIM_ConcreteJob::JobInParameters), Instance*>);
    Ref<NVRHBA_FCPort> port(create_as<NVRHBA_FCPort>());
    EXPECT_EQ(port->EnabledState.value, 5);
    EXPECT_EQ(port->EnabledState.null, 0);
    EXPECT_EQ(port->LocationIndicator.null, 1);
}
