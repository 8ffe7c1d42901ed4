// The texts that the generator makes, and the input that it refuses.
#include "generator/Emit.h"
#include "generator/Output.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>

using namespace generator;
using ::testing::HasSubstr;
using ::testing::Not;

namespace {

/// A folder with MOF and lists for one test.
class Generator : public ::testing::Test {
protected:
    Generator()
    {
        std::string name = (std::filesystem::temp_directory_path() / "generator_test_XXXXXX").string();
        folder = mkdtemp(name.data());
        std::filesystem::create_directory(folder / "mof");
        write("mof/a.mof", "class A { [Key] uint8 k; uint32 M(A REF p); }; class B : A { string s; };"
                           "[Association] class L { [Key] A REF a; [Key] B REF b; }; [Indication] class I {};");
        write("catalogue.txt", "A\nB\nL\nI\n");
        write("providers.txt", "derived some/Derived.h\nB plain\nA own some/A_Provider.h\nL san\nI own some/I.h\n");
    }
    ~Generator() override { std::filesystem::remove_all(folder); }

    void write(const std::string& name, const std::string& text) { std::ofstream(folder / name) << text; }

    /// Reads the folder; the reason of a refusal, or "".
    std::string read()
    {
        catalogue = std::make_unique<Catalogue>();
        try {
            catalogue->read((folder / "mof").string(), (folder / "catalogue.txt").string(),
                            (folder / "providers.txt").string());
        } catch (const Error& error) {
            return error.what();
        }
        return "";
    }

    std::filesystem::path folder;
    std::unique_ptr<Catalogue> catalogue;
};

} // namespace

TEST_F(Generator, TheSameInputGivesTheSameText)
{
    ASSERT_EQ(read(), "");
    const std::string records = emit_records(*catalogue);
    const std::string table =
        emit_providers(*catalogue, 0, 4) + emit_registrations(*catalogue) + emit_exports(*catalogue);
    ASSERT_EQ(read(), "");
    EXPECT_EQ(emit_records(*catalogue), records);
    EXPECT_EQ(emit_providers(*catalogue, 0, 4) + emit_registrations(*catalogue) + emit_exports(*catalogue), table);
}

TEST_F(Generator, AClassThatTheCatalogueLeavesOutIsRefused)
{
    write("catalogue.txt", "A\nB\nL\n");
    EXPECT_THAT(read(), HasSubstr("\"I\" is declared but not listed"));
}

TEST_F(Generator, AClassThatNoMofDeclaresIsRefused)
{
    write("catalogue.txt", "A\nB\nL\nI\nX # a comment\n");
    EXPECT_THAT(read(), HasSubstr("no MOF file declares \"X\""));
}

TEST_F(Generator, AClassListedTwiceIsRefused)
{
    write("catalogue.txt", "A\nB\nL\nI\na\n");
    EXPECT_THAT(read(), HasSubstr("\"a\" is listed twice"));
    write("catalogue.txt", "A\nB\nL\nI\n");
    write("providers.txt", "derived d.h\nB plain\nB plain\n");
    EXPECT_THAT(read(), HasSubstr("\"B\" is listed twice"));
}

TEST_F(Generator, AProviderOfUnknownKindIsRefused)
{
    for (const char* line : {"B", "B fancy", "B own", "B plain more"}) {
        write("providers.txt", std::string("derived d.h\n") + line + "\n");
        EXPECT_THAT(read(), HasSubstr("\"B\" needs")) << line;
    }
    write("providers.txt", "B plain\n");
    EXPECT_THAT(read(), HasSubstr("derived HEADER"));
    write("providers.txt", "X plain\n");
    EXPECT_THAT(read(), HasSubstr("no MOF file declares \"X\""));
}

TEST_F(Generator, BadMofIsRefusedWithItsPlace)
{
    write("mof/b.mof", "class Bad {\n uint7 a; };");
    EXPECT_THAT(read(), HasSubstr("b.mof:2:2: \"uint7\" is no type"));
    write("mof/b.mof", "class Bad {\n [EmbeddedInstance (\"Nobody\")] string a; };");
    write("catalogue.txt", "A\nB\nL\nI\nBad\n");
    EXPECT_THAT(read(), HasSubstr("b.mof:2: \"a\" embeds instances of \"Nobody\", which is not declared"));
}

TEST_F(Generator, MissingListsAreRefused)
{
    std::filesystem::remove(folder / "providers.txt");
    EXPECT_THAT(read(), HasSubstr("providers.txt: cannot read the file"));
    std::filesystem::remove(folder / "catalogue.txt");
    EXPECT_THAT(read(), HasSubstr("catalogue.txt: cannot read the file"));
}

TEST_F(Generator, AHeaderNamesWhatItRefersToAndNoMore)
{
    ASSERT_EQ(read(), "");
    const std::string header = emit_class_header(*catalogue, *catalogue->mof.find_class("L"));
    EXPECT_THAT(header, HasSubstr("struct A;\nstruct B;\n\nstruct L : Instance {\n    // L\n    A* a;\n    B* b;\n"));
    const std::string derived = emit_class_header(*catalogue, *catalogue->mof.find_class("B"));
    EXPECT_THAT(derived, HasSubstr("#include \"classes/A.h\""));
    EXPECT_THAT(derived, Not(HasSubstr("A_M_method : Instance")));
}

TEST_F(Generator, InheritedMethodsAreAnsweredAndOwnOnesAreNot)
{
    ASSERT_EQ(read(), "");
    EXPECT_THAT(emit_methods_header(*catalogue->mof.find_class("B")),
                HasSubstr("Invoke_Method_Status M(Arguments&&...)"));
    EXPECT_THAT(emit_methods_header(*catalogue->mof.find_class("A")), Not(HasSubstr("Invoke_Method_Status")));
}

TEST_F(Generator, EntriesFollowTheKindOfTheClass)
{
    ASSERT_EQ(read(), "");
    EXPECT_EQ(emit_exports(*catalogue),
              "{\nglobal:\n    cimple_module;\n    __cimple_trace;\n    __cimple_assert;\n"
              "    _thread_context_key;\n    _thread_context_key_once;\n"
              "    B_Create_InstanceMI;\n    B_Provider_Create_InstanceMI;\n"
              "    B_Create_MethodMI;\n    B_Provider_Create_MethodMI;\n"
              "    A_Create_InstanceMI;\n    A_Provider_Create_InstanceMI;\n"
              "    A_Create_MethodMI;\n    A_Provider_Create_MethodMI;\n"
              "    L_Create_InstanceMI;\n    L_Provider_Create_InstanceMI;\n"
              "    L_Create_MethodMI;\n    L_Provider_Create_MethodMI;\n"
              "    L_Create_AssociationMI;\n    L_Provider_Create_AssociationMI;\n"
              "    I_Create_IndicationMI;\n    I_Provider_Create_IndicationMI;\n"
              "    I_Create_MethodMI;\n    I_Provider_Create_MethodMI;\nlocal:\n    *;\n};\n");
}

TEST_F(Generator, UnitsShareOutTheProvidersInOrder)
{
    ASSERT_EQ(read(), "");
    const std::string first = emit_providers(*catalogue, 0, 2);
    const std::string second = emit_providers(*catalogue, 2, 4);
    EXPECT_THAT(first, HasSubstr("#include \"some/A_Provider.h\""));
    EXPECT_THAT(first, HasSubstr("&registrations[1]"));
    EXPECT_THAT(first, Not(HasSubstr("int L_proc")));
    EXPECT_THAT(second, HasSubstr("static constexpr bool is_san = true"));
    EXPECT_THAT(second, HasSubstr("derivedObjects/L_Provider"));
    EXPECT_THAT(second, HasSubstr("&registrations[3]"));
    EXPECT_THAT(second, HasSubstr("indication_proc<I_Provider, I>("));
}

TEST_F(Generator, AFileThatHoldsItsTextAlreadyKeepsItsTime)
{
    const auto path = folder / "deep" / "er" / "file.txt";
    write_file(path.string(), "text");
    const auto old = std::filesystem::file_time_type::clock::now() - std::chrono::hours(1);
    std::filesystem::last_write_time(path, old);
    write_file(path.string(), "text");
    EXPECT_EQ(std::filesystem::last_write_time(path), old);
    write_file(path.string(), "other");
    EXPECT_NE(std::filesystem::last_write_time(path), old);
}

TEST_F(Generator, AFileThatCannotBeWrittenIsAnError)
{
    EXPECT_THROW(write_file((folder / "mof").string(), "text"), Error);
}
