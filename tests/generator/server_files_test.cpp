// The files for CIM servers: the MOF read back against the records in the module, feature by feature, and the
// registrations against the list of providers.
#include "generator/Emit_Server_Files.h"

#include "classes/repository.h"

#include <algorithm>
#include <set>
#include <sstream>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

using namespace generator;
using testing::HasSubstr;

namespace {

const Catalogue& catalogue()
{
    static const Catalogue* const read = [] {
        auto* made = new Catalogue;
        const std::string folder = CLASSES_DIR;
        made->read(folder + "/mof", folder + "/catalogue.txt", folder + "/providers.txt");
        return made;
    }();
    return *read;
}

const std::vector<Text_File>& files()
{
    static const auto* const made = new std::vector<Text_File>(emit_server_files(catalogue(), "1.2.3"));
    return *made;
}

const std::string& text_of(const std::string& name)
{
    const auto at = std::find_if(files().begin(), files().end(), [&](const auto& file) { return file.first == name; });
    if (at == files().end()) throw std::runtime_error("no file " + name);
    return at->second;
}

std::size_t count_of(const std::string& text, const std::string& part)
{
    std::size_t count = 0;
    for (std::size_t at = text.find(part); at != std::string::npos; at = text.find(part, at + part.size()))
        ++count;
    return count;
}

/// Reads files one after the other; a fault in any of them fails the test.
void read_back(mof::Repository& repository, std::initializer_list<const char*> names)
{
    for (const char* name : names)
        EXPECT_TRUE(repository.read_text(name, text_of(name))) << repository.fault_text();
    EXPECT_TRUE(repository.resolve()) << repository.fault_text();
}

void expect_same_type(const mof::Typed_Element& read, const cimple::Meta_Feature& record, const std::string& what)
{
    const Shape shape = shape_of(read);
    EXPECT_EQ(shape.is_reference, cimple::is_reference(&record)) << what;
    if (shape.is_reference) {
        const auto& reference = *cimple::as_reference(&record);
        EXPECT_EQ(shape.target.empty() ? "Instance" : shape.target,
                  reference.meta_class ? reference.meta_class->name : "Instance")
            << what;
        EXPECT_EQ(shape.subscript, reference.subscript) << what;
    } else if (cimple::is_property(&record)) {
        const auto& property = *cimple::as_property(&record);
        EXPECT_EQ(static_cast<unsigned>(shape.type), static_cast<unsigned>(property.type)) << what;
        EXPECT_EQ(shape.subscript, property.subscript) << what;
    }
}

void expect_same_class(const mof::Class& read, const cimple::Meta_Class& record)
{
    EXPECT_EQ(read.super_name, record.super_meta_class ? record.super_meta_class->name : "") << read.name;
    EXPECT_EQ(class_flags(read), record.flags) << read.name;
    ASSERT_EQ(read.features.size(), record.num_meta_features) << read.name;
    for (std::size_t i = 0; i < read.features.size(); ++i) {
        const mof::Feature& feature = *read.features[i];
        const cimple::Meta_Feature& other = *record.meta_features[i];
        const std::string what = read.name + "." + feature.name;
        EXPECT_EQ(feature.name, other.name) << what;
        EXPECT_EQ(feature_flags(feature), other.flags) << what;
        if (feature.kind != mof::Feature::Kind::method) {
            expect_same_type(feature, other, what);
            continue;
        }
        const auto& method = reinterpret_cast<const cimple::Meta_Method&>(other);
        // The record of a call has the return value behind the parameters.
        ASSERT_EQ(feature.parameters.size() + 1, method.num_meta_features) << what;
        for (std::size_t p = 0; p < feature.parameters.size(); ++p) {
            EXPECT_EQ(feature.parameters[p].name, method.meta_features[p]->name) << what;
            EXPECT_EQ(parameter_flags(feature.parameters[p]), method.meta_features[p]->flags) << what;
            expect_same_type(feature.parameters[p], *method.meta_features[p], what + "." + feature.parameters[p].name);
        }
    }
}

/// The number of constants in it.
std::size_t expect_same_value(const mof::Value& is, const mof::Value& was, const std::string& what)
{
    EXPECT_EQ(is.is_array, was.is_array) << what;
    EXPECT_EQ(is.items.size(), was.items.size()) << what;
    for (std::size_t i = 0; i < std::min(is.items.size(), was.items.size()); ++i) {
        const mof::Literal &left = is.items[i], &right = was.items[i];
        EXPECT_EQ(left.kind, right.kind) << what;
        EXPECT_EQ(left.boolean, right.boolean) << what;
        EXPECT_EQ(left.negative, right.negative) << what;
        EXPECT_EQ(left.magnitude, right.magnitude) << what;
        EXPECT_EQ(left.real, right.real) << what;
        EXPECT_EQ(left.text, right.text) << what;
    }
    return was.items.size();
}

/// The number of constants in them. Association and Indication may have moved to the front.
std::size_t expect_same_qualifiers(const mof::Qualifiers& is, const mof::Qualifiers& was, const std::string& what)
{
    EXPECT_EQ(is.size(), was.size()) << what;
    std::size_t values = 0;
    for (const mof::Qualifier& qualifier : was) {
        const mof::Qualifier* other = is.find(qualifier.name);
        EXPECT_TRUE(other) << what << ": " << qualifier.name;
        if (other) values += expect_same_value(other->value, qualifier.value, what + ": " + qualifier.name);
    }
    return values;
}

/// The classes that an element needs before it, but for ends of associations.
void expect_declared_before(const mof::Class& target, const std::set<std::string>& seen)
{
    if (!target.super_name.empty()) {
        EXPECT_EQ(seen.count(target.super_name), 1u) << target.name;
    }
    for (const auto& feature : target.declared)
        for (const mof::Parameter& parameter : feature->parameters)
            if (parameter.type == mof::Type::reference) {
                EXPECT_EQ(seen.count(parameter.target), 1u) << target.name << "." << feature->name;
            }
}

} // namespace

TEST(ServerFiles, HoldTheVeryClassesOfTheModule)
{
    mof::Repository repository;
    read_back(repository, {"mof/00_qualifiers.mof", "mof/10_schema.mof", "mof/20_module.mof"});
    EXPECT_EQ(repository.classes().size(), cimple::the_repository.num_meta_classes);
    for (std::size_t i = 0; i < cimple::the_repository.num_meta_classes; ++i) {
        const cimple::Meta_Class& record = *cimple::the_repository.meta_classes[i];
        const mof::Class* read = repository.find_class(record.name);
        ASSERT_TRUE(read) << record.name;
        expect_same_class(*read, record);
    }
}

TEST(ServerFiles, KeepWhatClientsRead)
{
    mof::Repository repository;
    read_back(repository, {"mof/00_qualifiers.mof", "mof/10_schema.mof", "mof/20_module.mof"});
    std::size_t values = 0;
    for (const mof::Class* source : catalogue().classes) {
        const mof::Class& read = *repository.find_class(source->name);
        values += expect_same_qualifiers(read.qualifiers, source->qualifiers, source->name);
        ASSERT_EQ(read.declared.size(), source->declared.size()) << source->name;
        for (std::size_t i = 0; i < source->declared.size(); ++i) {
            const mof::Feature &was = *source->declared[i], &is = *read.declared[i];
            const std::string what = source->name + "." + was.name;
            EXPECT_EQ(is.name, was.name) << what;
            EXPECT_EQ(is.has_default, was.has_default) << what;
            if (was.has_default) values += expect_same_value(is.default_value, was.default_value, what);
            values += expect_same_qualifiers(is.qualifiers, was.qualifiers, what);
            ASSERT_EQ(is.parameters.size(), was.parameters.size()) << what;
            for (std::size_t k = 0; k < was.parameters.size(); ++k)
                values += expect_same_qualifiers(is.parameters[k].qualifiers, was.parameters[k].qualifiers,
                                                 what + "." + was.parameters[k].name);
        }
    }
    EXPECT_GT(values, 7000u);
}

TEST(ServerFiles, KeepTheDeclarationsOfQualifiers)
{
    mof::Repository repository;
    read_back(repository, {"mof/00_qualifiers.mof"});
    ASSERT_EQ(repository.qualifiers().size(), catalogue().mof.qualifiers().size());
    for (std::size_t i = 0; i < repository.qualifiers().size(); ++i) {
        const mof::Qualifier_Declaration &is = repository.qualifiers()[i], &was = catalogue().mof.qualifiers()[i];
        EXPECT_EQ(is.name, was.name);
        EXPECT_EQ(is.type, was.type) << was.name;
        EXPECT_EQ(is.is_array, was.is_array) << was.name;
        EXPECT_EQ(is.scopes, was.scopes) << was.name;
        EXPECT_EQ(is.flavors, was.flavors) << was.name;
        EXPECT_EQ(is.has_default, was.has_default) << was.name;
        if (was.has_default) expect_same_value(is.default_value, was.default_value, was.name);
    }
}

TEST(ServerFiles, DeclareEachClassBeforeItsUse)
{
    for (const auto& order : {std::vector<const char*>{"mof/10_schema.mof", "mof/20_module.mof"},
                              std::vector<const char*>{"interop/30_schema.mof", "interop/31_module.mof"}}) {
        mof::Repository repository;
        EXPECT_TRUE(repository.read_text("qualifiers", text_of("mof/00_qualifiers.mof")));
        for (const char* name : order)
            EXPECT_TRUE(repository.read_text(name, text_of(name)));
        EXPECT_TRUE(repository.resolve()) << repository.fault_text();
        std::set<std::string> seen;
        for (const mof::Class* target : repository.classes()) {
            expect_declared_before(*target, seen);
            seen.insert(target->name);
        }
    }
}

TEST(ServerFiles, HoldTheProfilesOnceMoreForTheInteropNamespace)
{
    mof::Repository repository;
    read_back(repository, {"mof/00_qualifiers.mof", "interop/30_schema.mof", "interop/31_module.mof"});
    for (const char* name :
         {"NVRHBA_RegisteredProfile", "NVRHBA_ReferencedProfile", "NVRHBA_BaseServerReferencedProfile",
          "NVRHBA_ComputerSystemConformsToProfile", "NVRHBA_FCPortConformsToProfile",
          "NVRHBA_PortControllerConformsToProfile", "NVRHBA_SoftwareConformsToProfile",
          "NVRHBA_PCIElementConformsToProfile", "NVRHBA_InstallServiceConformsToProfile",
          "NVRHBA_RecordLogConformsToProfile", "NVRHBA_DiagServiceConformsToProfile"})
        EXPECT_TRUE(repository.find_class(name)) << name;
    EXPECT_FALSE(repository.find_class("NVRHBA_StorageVolume"));
}

TEST(ServerFiles, ListEachClassWithItsFile)
{
    std::istringstream list(text_of("classes.txt"));
    std::size_t lines = 0;
    for (std::string file, name; list >> file >> name; ++lines)
        EXPECT_THAT(text_of(file), HasSubstr("class " + name + " "));
    EXPECT_GT(lines, 260u);
}

TEST(ServerFiles, KeepLinesShort)
{
    for (const auto& [name, text] : files()) {
        std::istringstream lines(text);
        for (std::string line; std::getline(lines, line);)
            EXPECT_LT(line.size(), 128u) << name << ": " << line;
    }
}

TEST(ServerFiles, RegisterEachProviderWithSfcb)
{
    const std::string& text = text_of("sfcb/norvane_fc_provider.reg");
    EXPECT_EQ(count_of(text, "   group: norvane_fc_provider\n   unload: never\n"), catalogue().providers.size());
    EXPECT_THAT(text, HasSubstr("[NVRHBA_FCPort]\n   provider: NVRHBA_FCPort_Provider\n"
                                "   location: norvane_fc_provider\n   type: instance method\n"
                                "   namespace: root/norvane\n"));
    EXPECT_THAT(text, HasSubstr("[NVRHBA_AlertIndication]\n   provider: NVRHBA_AlertIndication_Provider\n"
                                "   location: norvane_fc_provider\n   type: indication method\n"));
    EXPECT_THAT(text,
                HasSubstr("[NVRHBA_FCPortConformsToProfile]\n   provider: NVRHBA_FCPortConformsToProfile_Provider\n"
                          "   location: norvane_fc_provider\n   type: instance method association\n"
                          "   namespace: root/norvane root/pg_interop root/interop\n"));
}

TEST(ServerFiles, RegisterEachProviderWithOpenPegasus)
{
    const std::string& text = text_of("pegasus/registration.mof");
    EXPECT_EQ(count_of(text, "instance of PG_ProviderModule {"), 1u);
    EXPECT_EQ(count_of(text, "instance of PG_Provider {"), catalogue().providers.size());
    EXPECT_EQ(count_of(text, "instance of PG_ProviderCapabilities {"), catalogue().providers.size());
    EXPECT_THAT(text, HasSubstr("    Version = \"1.2.3\";\n    InterfaceType = \"CMPI\";\n"));
    EXPECT_THAT(text, HasSubstr("    ClassName = \"NVRHBA_FCPort\";\n    Namespaces = { \"root/norvane\" };\n"
                                "    ProviderType = { 2, 5 };\n"));
    EXPECT_THAT(text, HasSubstr("    ClassName = \"NVRHBA_AlertIndication\";\n    Namespaces = { \"root/norvane\" };\n"
                                "    ProviderType = { 4, 5 };\n"));
    for (std::size_t i = 1; i <= catalogue().providers.size(); ++i)
        EXPECT_EQ(count_of(text, "CapabilityID = \"" + std::to_string(i) + "\";"), 1u);
}
