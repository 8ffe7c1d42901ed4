// Pages of the class reference over a schema of a few classes, and the lists of profiles that are refused.
#include "generator/Reference.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>

using namespace generator;
using ::testing::HasSubstr;

namespace {

constexpr char mof_text[] = R"(
[Abstract] class Base { [Key, Description ("A name | an id.")] string Name; uint32 Start(); };
[Description ("A thing of <some> kind. See CIM_Other.")]
class CIM_Thing : Base {
    [Write, Units ("Bytes"), Description ("How much.")] uint32 Size = 4;
    [ValueMap {"0", "2", ".."}, Values {"Off", "On", "Reserved"}] uint16 State[];
    [Override ("Name")] string Name;
    [Description ("Does it.")] uint8 Act([In, Out, Description ("Which.")] CIM_Thing REF Which, [In] boolean Now);
};
[Description ("Another.")] class CIM_Other : CIM_Thing {};
[Association, Description ("Ties things.")] class CIM_Tie { [Key] CIM_Thing REF Left; [Key] CIM_Other REF Right; };
)";

class Reference : public ::testing::Test {
protected:
    Reference()
    {
        std::string name = (std::filesystem::temp_directory_path() / "reference_test_XXXXXX").string();
        folder = mkdtemp(name.data());
        std::filesystem::create_directory(folder / "mof");
        write("mof/a.mof", mof_text);
        write("catalogue.txt", "Base\nCIM_Thing\nCIM_Other\nCIM_Tie\n");
        write("providers.txt", "derived some/Derived.h\nCIM_Thing san\nCIM_Tie plain\n");
        write("profiles.txt", "# a comment\nprofile Some Things\nabout What there is.\nCIM_Thing\n\nbeyond Ties\n"
                              "about What ties it.\n  CIM_Tie\n  CIM_Thing\n");
        catalogue.read(path("mof"), path("catalogue.txt"), path("providers.txt"));
    }
    ~Reference() override { std::filesystem::remove_all(folder); }

    std::string path(const std::string& name) const { return (folder / name).string(); }
    void write(const std::string& name, const std::string& text) { std::ofstream(folder / name) << text; }
    std::vector<Subject> subjects() { return read_subjects(catalogue, path("profiles.txt")); }
    std::string page(const char* name)
    {
        return emit_class_page(catalogue, subjects(), *catalogue.mof.find_class(name));
    }
    /// Why a list of profiles is refused, or "".
    std::string refusal(const std::string& profiles)
    {
        write("profiles.txt", profiles);
        try {
            subjects();
        } catch (const Error& error) {
            return error.what();
        }
        return "";
    }

    std::filesystem::path folder;
    Catalogue catalogue;
};

} // namespace

TEST_F(Reference, PageOfAClassTellsAllOfIt)
{
    EXPECT_EQ(page("CIM_Thing"), R"(# CIM_Thing

A thing of \<some\> kind. See [CIM_Other](CIM_Other.md).

| | |
|---|---|
| kind | class |
| superclass | [Base](Base.md) |
| subclasses | [CIM_Other](CIM_Other.md) |
| profiles | [Some Things](index.md#some-things) |
| beyond the profiles | [Ties](index.md#ties) |
| instances | by this module, from its cache of the SAN |
| keys | Name |

## Own properties

| name | type | meaning |
|---|---|---|
| **Name** | `string`, key | A name \| an id. |
| **Size** | `uint32`, writable | How much. *Unit:* Bytes. *Default:* 4. |
| **State** | `uint16[]` | *Values:* `0` Off, `2` On, others Reserved. |

## Methods

### Act

Does it.

Returns `uint8`.

| parameter | | type | meaning |
|---|---|---|---|
| **Which** | in, out | [CIM_Thing](CIM_Thing.md) ref | Which. |
| **Now** | in | `boolean` |  |

## Inherited methods

Those that the module does not serve answer "not supported".

- Start, from [Base](Base.md)

## Associations

| association | this class is its | and it leads to |
|---|---|---|
| [CIM_Tie](CIM_Tie.md) | Left | [CIM_Other](CIM_Other.md) (Right) |

---
All classes [by profile](index.md) and [by name](names.md).
)");
}

TEST_F(Reference, PageOfASubclassGroupsWhatItInherits)
{
    const std::string text = page("CIM_Other");
    EXPECT_THAT(text, HasSubstr("| superclass | [CIM_Thing](CIM_Thing.md) \\< [Base](Base.md) |\n"));
    EXPECT_THAT(text, HasSubstr("| instances | none by this module |\n"));
    EXPECT_THAT(text,
                HasSubstr("\n## Inherited from [CIM_Thing](CIM_Thing.md)\n\n| name | type | meaning |\n|---|---|---|\n"
                          "| **Name** | `string`, key | A name \\| an id. |\n| **Size** |"));
    // An end of the narrower class, and one of its superclass.
    EXPECT_THAT(text, HasSubstr("| Left | [CIM_Other](CIM_Other.md) (Right) |\n| [CIM_Tie](CIM_Tie.md) | Right | "
                                "[CIM_Thing](CIM_Thing.md) (Left) |\n"));
}

TEST_F(Reference, IndicesNameTheClassesByProfileAndByName)
{
    const std::string index = emit_profile_index(subjects());
    EXPECT_THAT(index, HasSubstr("- [Some Things](#some-things)\n\nBeyond the profiles:\n\n- [Ties](#ties)\n"));
    EXPECT_THAT(index,
                HasSubstr("<a id=\"ties\"></a>\n\n## Ties\n\nWhat ties it.\n\n| class | what it is |\n|---|---|\n"
                          "| [CIM_Tie](CIM_Tie.md) | Ties things. |\n"
                          "| [CIM_Thing](CIM_Thing.md) | A thing of \\<some\\> kind. |\n"));
    EXPECT_THAT(emit_name_index(catalogue),
                HasSubstr("| [CIM_Thing](CIM_Thing.md) | A thing of \\<some\\> kind. |\n"
                          "| [CIM_Tie](CIM_Tie.md) | Ties things. |\n\n## Classes that they"));
}

TEST_F(Reference, AListOfProfilesThatIsWrongIsRefusedWithItsLine)
{
    EXPECT_THAT(refusal("CIM_Thing\n"), HasSubstr("profiles.txt:1: say \"profile NAME\""));
    EXPECT_THAT(refusal("profile P\nabout it\nCIM_None\n"),
                HasSubstr("profiles.txt:3: no MOF file declares \"CIM_None\""));
    EXPECT_THAT(refusal("profile P\nabout it\nCIM_Thing\ncim_thing\n"),
                HasSubstr("profiles.txt:4: \"cim_thing\" is listed twice"));
    EXPECT_THAT(refusal("profile P\nCIM_Thing\nCIM_Tie\n"), HasSubstr("\"P\" does not say what it is about"));
    EXPECT_THAT(refusal("profile P\nabout it\nCIM_Thing\n"),
                HasSubstr("\"CIM_Tie\" has a provider and stands under no profile"));
    std::filesystem::remove(path("profiles.txt"));
    EXPECT_THROW(subjects(), Error);
}
