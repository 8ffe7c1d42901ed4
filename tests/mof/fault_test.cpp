// Bad text: the fault's place and reason, and no way to crash or to hang.
#include "tests/mof/mof_testing.h"

#include <cstdlib>
#include <filesystem>
#include <fstream>

using namespace mof;
using mof::testing::fault;
using mof::testing::read;

TEST(MofFault, NamesFileLineColumnAndReason)
{
    const auto mof = read("class C {\n    uint8 a\n};");
    ASSERT_EQ(mof->faults().size(), 1u);
    EXPECT_EQ(mof->faults()[0].text(), "t.mof:3:1: expected \";\" behind the feature, found \"}\"");
}

TEST(MofFault, EachMistakeHasItsPlace)
{
    EXPECT_EQ(fault("klass C {};"), "1:1: expected a class, a qualifier declaration or a pragma, found \"klass\"");
    EXPECT_EQ(fault("class {};"), "1:7: expected the class's name, found \"{\"");
    EXPECT_EQ(fault("class C"), "1:8: expected \"{\" before the features of the class, found the end of the text");
    EXPECT_EQ(fault("class C {}"), "1:11: expected \";\" behind the class, found the end of the text");
    EXPECT_EQ(fault("class C { uint7 a; };"), "1:11: \"uint7\" is no type, and no class without REF behind it");
    EXPECT_EQ(fault("class C { uint8 a[; };"), "1:19: expected \"]\" behind the length of the array, found \";\"");
    EXPECT_EQ(fault("class C { uint8 a[0]; };"), "1:19: the length of an array is 1 to 32767");
    EXPECT_EQ(fault("class C { uint8 a; uint8 A; };"), "1:26: \"A\" is declared twice in C");
    EXPECT_EQ(fault("class C { uint8 M(uint8 a uint8 b); };"),
              "1:27: expected \",\" between parameters, found \"uint8\"");
    EXPECT_EQ(fault("class C { uint8 M(uint8 a,); };"), "1:27: expected a parameter behind \",\", found \")\"");
    EXPECT_EQ(fault("class C { uint8 M(uint8 a, uint8 a); };"), "1:34: \"a\" is declared twice in M");
    EXPECT_EQ(fault("class C { C REF M(); };"), "1:17: a method cannot return a reference");
    EXPECT_EQ(fault("[Key, Key] class C {};"), "1:7: \"Key\" is said twice");
    EXPECT_EQ(fault("[Key Write] class C {};"), "1:6: expected \",\" between qualifiers, found \"Write\"");
    EXPECT_EQ(fault("class C {}; \n class c {};"), "2:8: the class \"c\" was declared before, at t.mof:1");
    EXPECT_EQ(fault("instance of C { a = 1; };"), "1:1: instance declarations are not read here: declare classes only");
    EXPECT_EQ(fault("#include <x>"), "1:1: \"#\" begins a pragma only");
    EXPECT_EQ(fault("class C { } ; @"), "1:15: a character that MOF does not use here");
}

TEST(MofFault, ValuesMustFitTheirType)
{
    EXPECT_EQ(fault("class C { uint8 a = 256; };"), "1:21: the value is no uint8");
    EXPECT_EQ(fault("class C { uint8 a = -1; };"), "1:21: the value is no uint8");
    EXPECT_EQ(fault("class C { sint8 a = -129; };"), "1:21: the value is no sint8");
    EXPECT_EQ(fault("class C { boolean a = 1; };"), "1:23: the value is no boolean");
    EXPECT_EQ(fault("class C { string a = 1; };"), "1:22: the value is no string");
    EXPECT_EQ(fault("class C { datetime a = \"now\"; };"), "1:24: the value is no datetime");
    EXPECT_EQ(fault("class C { uint8 a = {1}; };"), "1:21: a list as the value of a scalar");
    EXPECT_EQ(fault("class C { uint8 a[] = 1; };"), "1:23: a single value for an array");
    EXPECT_EQ(fault("class C { uint8 a[2] = {1, 2, 3}; };"), "1:24: more values than the array holds");
    EXPECT_EQ(fault("class C { uint64 a = 18446744073709551616; };"), "1:22: the number does not fit 64 bits");
    EXPECT_EQ(fault("class C { uint8 a = 08; };"),
              "1:21: a leading zero makes the number octal: 8 and 9 cannot be in it");
    EXPECT_EQ(fault("class C { uint8 a = 0xg; };"), "1:21: not a hexadecimal number");
    EXPECT_EQ(fault("class C { real32 a = 1.; };"), "1:22: a real number needs digits behind its point");
}

TEST(MofFault, StringsAndCommentsMustEnd)
{
    EXPECT_EQ(fault("class C { string a = \"x\n\"; };"), "1:22: the string that begins here has no end");
    EXPECT_EQ(fault("class C {}; /* never"), "1:13: the comment that begins here has no end");
    EXPECT_EQ(fault("class C { string a = \"\\q\"; };"), "1:22: an unknown escape sequence");
    EXPECT_EQ(fault("class C { string a = \"\\x0\"; };"), "1:22: a string cannot hold the zero character");
    EXPECT_EQ(fault("class C { string a = \"\\xD800\"; };"), "1:22: half of a surrogate pair is no character");
    EXPECT_EQ(fault("class C { char16 a = 'ab'; };"),
              "1:22: a character constant holds one character between single quotes");
    EXPECT_EQ(fault(std::string("class C { string a = \"x\0y\"; };", 30)),
              "1:22: a string cannot hold the zero character");
}

TEST(MofFault, ResolvingTellsAllThatIsWrong)
{
    const auto mof =
        read("class A : Nowhere {};\nclass B { Nobody REF r; };\nclass C { uint8 M(Nobody REF p); };\n"
             "class D { [Override (\"x\")] uint8 x; };\nclass E { uint8 a; };\nclass F : E { string a; };\n"
             "class G : E { [Override (\"a\")] uint8 b; };\nclass H { E REF r; };\nclass I : H { A REF r; };");
    EXPECT_EQ(mof->fault_text(), "t.mof:1:7: the superclass \"Nowhere\" is not declared\n"
                                 "t.mof:4:34: \"x\" overrides nothing: no superclass declares it\n"
                                 "t.mof:6:22: \"a\" is of another kind or type than in E\n"
                                 "t.mof:7:38: \"b\" overrides a feature of another name\n"
                                 "t.mof:2:22: \"r\" refers to \"Nobody\", which is not declared\n"
                                 "t.mof:3:30: \"p\" refers to \"Nobody\", which is not declared\n"
                                 "t.mof:9:21: \"r\" refers to \"A\", which does not derive from \"E\"\n");
}

TEST(MofFault, QualifiersAreHeldAgainstTheirDeclarations)
{
    const std::string declared =
        "Qualifier Key : boolean = false, Scope(any); Qualifier Max : uint32 = NULL, Scope(any);"
        "Qualifier Values : string[], Scope(any);\n";
    EXPECT_EQ(fault(declared + "class C { [Kye] uint8 a; };"), "2:12: the qualifier \"Kye\" is not declared");
    EXPECT_EQ(fault(declared + "class C { [Max (\"3\")] uint8 a; };"), "2:12: the value of \"Max\" is no uint32");
    EXPECT_EQ(fault(declared + "class C { [Max {3}] uint8 a; };"), "2:12: the qualifier \"Max\" takes a single value");
    EXPECT_EQ(fault(declared + "class C { uint8 M([Values (\"a\")] uint8 a); };"),
              "2:20: the qualifier \"Values\" takes a list");
    EXPECT_EQ(fault(declared + "Qualifier key : boolean;"), "2:11: the qualifier \"key\" was declared before");
    EXPECT_EQ(fault(declared + "class C { [Max (3), Values {\"a\"}, Key (false)] uint8 a; };"), "");
}

TEST(MofFault, ACircleOfSuperclassesIsFound)
{
    EXPECT_EQ(fault("class A : B {}; class B : C {}; class C : A {};"),
              "1:7: the superclasses of \"A\" are a circle, or too many");
    EXPECT_EQ(fault("class A : A {};"), "1:7: the superclasses of \"A\" are a circle, or too many");
}

TEST(MofFault, ALongChainOfClassesCostsNoStack)
{
    std::string text;
    for (int i = 0; i < 20000; ++i)
        text += "class C" + std::to_string(i) + " : C" + std::to_string(i + 1) + " {};\n";
    const auto mof = read(text + "class C20000 {};");
    EXPECT_FALSE(mof->faults().empty());
    EXPECT_EQ(mof->find_class("C0")->super, nullptr);
}

TEST(MofFault, BracketsNestedWithoutEndAreJustAFault)
{
    for (const char* bracket : {"{", "[", "(", "\"", "'", "/*", "#", "class C { [Values ", "class C { uint8 a = {"}) {
        std::string text;
        for (int i = 0; i < 100000; ++i)
            text += bracket;
        EXPECT_NE(fault(text), "") << bracket;
    }
}

TEST(MofFault, NoPrefixOfGoodTextCrashes)
{
    const std::string good =
        "#pragma namespace (\"x\")\n[Abstract, Values { \"a\" \"b\", \"c\" }] class C : D { [Key] string a[3] = "
        "{\"\\x41\", NULL}; C REF r; uint32 M([In (false), Out] C REF p[], char16 q); sint8 b = -0x7f; };"
        "Qualifier Q : uint32[] = {1, 10b}, Scope(any), Flavor(Restricted); class D {};";
    ASSERT_EQ(fault("Qualifier Abstract : boolean; Qualifier Values : string[]; Qualifier Key : boolean; Qualifier In "
                    ": boolean;"
                    "Qualifier Out : boolean;\n" +
                    good),
              "");
    for (std::size_t size = 1; size < good.size(); ++size)
        read(good.substr(0, size));
    for (std::size_t at = 0; at < good.size(); ++at) {
        for (const char c : {'\0', '"', '{', ']', '\x80', '0', '/'}) {
            std::string changed = good;
            changed[at] = c;
            read(changed);
        }
    }
}

namespace {

/// A folder of files for one test, removed with it.
class MofFiles : public ::testing::Test {
protected:
    MofFiles()
    {
        std::string name = (std::filesystem::temp_directory_path() / "mof_test_XXXXXX").string();
        folder = mkdtemp(name.data());
    }
    ~MofFiles() override { std::filesystem::remove_all(folder); }

    std::string write(const std::string& name, const std::string& text)
    {
        const auto path = folder / name;
        std::filesystem::create_directories(path.parent_path());
        std::ofstream(path) << text;
        return path.string();
    }

    std::filesystem::path folder;
};

} // namespace

TEST_F(MofFiles, AnIncludeIsRelativeToTheFileThatSaysIt)
{
    write("sub/b.mof", "#pragma include (\"c.mof\")\nclass B : C {};");
    write("sub/c.mof", "class C {};");
    Repository mof;
    EXPECT_TRUE(mof.read_file(write("a.mof", "#pragma include (\"sub/b.mof\")\nclass A : B {};")));
    EXPECT_TRUE(mof.resolve()) << mof.fault_text();
    EXPECT_TRUE(mof.find_class("A")->derives_from("C"));
}

TEST_F(MofFiles, AFileIsReadOnceEvenIfItIncludesItself)
{
    Repository mof;
    EXPECT_TRUE(mof.read_file(write("a.mof", "#pragma include (\"a.mof\")\nclass A {};")));
    EXPECT_TRUE(mof.read_file((folder / "a.mof").string()));
    EXPECT_TRUE(mof.resolve()) << mof.fault_text();
}

TEST_F(MofFiles, IncludesNestOnlySoDeep)
{
    for (int i = 0; i < 100; ++i)
        write("f" + std::to_string(i) + ".mof", "#pragma include (\"f" + std::to_string(i + 1) + ".mof\")");
    Repository mof;
    EXPECT_FALSE(mof.read_file((folder / "f0.mof").string()));
    EXPECT_NE(mof.fault_text().find("f16.mof:1:18: includes are nested too deep"), std::string::npos)
        << mof.fault_text();
}

TEST_F(MofFiles, AMissingFileIsAFaultOfTheIncludingOne)
{
    Repository mof;
    const std::string path = write("a.mof", "\n#pragma include (\"none.mof\")");
    EXPECT_FALSE(mof.read_file(path));
    EXPECT_EQ(mof.fault_text(), path + ":2:18: cannot read the file \"" + (folder / "none.mof").string() + "\"\n");
}

TEST_F(MofFiles, AFolderIsReadWithAllBelowIt)
{
    write("x/one.mof", "class One : Two {};");
    write("two.mof", "class Two {};");
    write("notes.txt", "not MOF");
    Repository mof;
    EXPECT_TRUE(mof.read_folder(folder.string()));
    EXPECT_TRUE(mof.resolve()) << mof.fault_text();
    EXPECT_EQ(mof.classes().size(), 2u);
}

TEST_F(MofFiles, AFolderWithoutMofIsAFault)
{
    Repository mof;
    EXPECT_FALSE(mof.read_folder(folder.string()));
    Repository other;
    EXPECT_FALSE(other.read_folder((folder / "none").string()));
    Repository directory;
    EXPECT_FALSE(directory.read_file(folder.string()));
}
