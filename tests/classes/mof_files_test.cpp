// The class files as a CIM server and its clients read them.
#include "mof/Repository.h"
#include "tests/classes/Expected.h"

#include <gtest/gtest.h>

using namespace mof;

namespace {

const Repository& class_files()
{
    static const Repository* const files = [] {
        auto* repository = new Repository;
        repository->read_folder(MOF_FOLDER);
        repository->resolve();
        return repository;
    }();
    return *files;
}

/// A sentence of its own: capital first, a full stop last, plain ASCII, no double blanks.
void expect_described(const Qualifiers& qualifiers, const std::string& what)
{
    const std::string& text = qualifiers.text("Description");
    ASSERT_FALSE(text.empty()) << what;
    EXPECT_EQ(text.back(), '.') << what;
    EXPECT_TRUE((text[0] >= 'A' && text[0] <= 'Z') || (text[0] >= '0' && text[0] <= '9')) << what << ": " << text;
    EXPECT_EQ(text.find("  "), std::string::npos) << what << ": " << text;
    for (const char c : text)
        EXPECT_TRUE(c >= ' ' && c <= '~') << what;
}

} // namespace

TEST(ClassFiles, ReadWithoutAFault)
{
    EXPECT_EQ(class_files().fault_text(), "");
    EXPECT_EQ(class_files().classes().size(), 260u);
}

TEST(ClassFiles, EverythingIsDescribed)
{
    int own = 0;
    for (const Class* target : class_files().classes()) {
        const bool is_schema = target->name.rfind("CIM_", 0) == 0;
        own += !is_schema;
        expect_described(target->qualifiers, target->name);
        for (const auto& feature : target->declared) {
            const std::string what = target->name + "." + feature->name;
            // An override of the schema's may mean what the overridden one says.
            if (!is_schema || !feature->overridden) expect_described(feature->qualifiers, what);
            if (is_schema) continue;
            for (const auto& parameter : feature->parameters)
                expect_described(parameter.qualifiers, what + "." + parameter.name);
        }
    }
    EXPECT_EQ(own, 143);
}

TEST(ClassFiles, ValueMapsAndValuesPairUp)
{
    const auto check = [](const Typed_Element& element, const std::string& what) {
        const Qualifier* map = element.qualifiers.find("ValueMap");
        const Qualifier* values = element.qualifiers.find("Values");
        EXPECT_TRUE(!map || !values || map->value.items.size() == values->value.items.size()) << what;
    };
    for (const Class* target : class_files().classes())
        for (const auto& feature : target->declared) {
            check(*feature, target->name + "." + feature->name);
            for (const auto& parameter : feature->parameters)
                check(parameter, target->name + "." + feature->name + "." + parameter.name);
        }
}

TEST(ClassFiles, AnOverrideOfTheModulesSaysSo)
{
    for (const Class* target : class_files().classes()) {
        if (target->name.rfind("NVRHBA_", 0) != 0) continue;
        for (const auto& feature : target->declared)
            EXPECT_EQ(feature->overridden != nullptr, feature->qualifiers.has("Override"))
                << target->name << "." << feature->name;
    }
}

TEST(ClassFiles, MethodsOfServicesAreFoundByTheirParameters)
{
    for (const auto& row : cimple::expected::rows("methods.txt")) {
        const Feature* method = class_files().find_class(row[0])->find_method(row[1]);
        ASSERT_NE(method, nullptr) << row[0] << "." << row[1];
        EXPECT_EQ(type_name(method->type), row[2]);
        ASSERT_EQ(method->parameters.size(), row.size() - 3);
        for (std::size_t i = 3; i < row.size(); ++i)
            EXPECT_EQ(method->parameters[i - 3].name, row[i].substr(row[i].rfind(':') + 1)) << row[0] << "." << row[1];
    }
}
