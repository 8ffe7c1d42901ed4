// The file of a tag table, written and read: what is in it, and what each damage to it costs.
#include <random>
#include <stdexcept>
#include <string>

#include <gmock/gmock.h>
#include <rapidxml/rapidxml.hpp>

#include "services/ApexConfig.h"
#include "tests/support/log_capture.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

namespace {

HBA_WWN wwn(std::uint64_t number)
{
    HBA_WWN name;
    for (int i = 7; i >= 0; i--, number >>= 8)
        name.wwn[i] = static_cast<HBA_UINT8>(number);
    return name;
}

std::uint64_t number(const HBA_WWN& name)
{
    std::uint64_t all = 0;
    for (const HBA_UINT8 byte : name.wwn)
        all = all << 8 | byte;
    return all;
}

Tag_Table two_entries()
{
    Tag_Table table = makeTagTable(2);
    table[0].source = wwn(0x10000000C9A00001);
    table[0].target = wwn(0x50060E8005A10000);
    table[0].tag = 7;
    table[1].source = wwn(0x10000000C9ABCDEF);
    table[1].target = wwn(0xFFFFFFFFFFFFFFFF);
    table[1].tag = 255;
    return table;
}

std::string written(const Tag_Table& table)
{
    return apexConfigText(table, {"20260101120000.000000+060", "storage1", "Norvane-FC2162-0"});
}

constexpr char head[] = "<ApexConfig><theSystem><ApexVersion/><CreationDate/><HostName/><Adapter/></theSystem>";

/// A document with these children of Configuration.
std::string with(const std::string& configuration)
{
    return head + ("<Configuration>" + configuration) + "</Configuration></ApexConfig>";
}

std::string row(const std::string& source, const std::string& target, const std::string& tag)
{
    return "<Row><src_wwpn>" + source + "</src_wwpn><tgt_wwpn>" + target + "</tgt_wwpn><tag>" + tag + "</tag></Row>";
}

std::string one_row(const std::string& tag = "1")
{
    return row("10000000c9a00001", "50060e8005a10000", tag);
}

/// The words of the failure; "bad_alloc"; or "" if it is read.
std::string failure(const std::string& text)
{
    try {
        readApexConfig(text);
        return "";
    } catch (const std::bad_alloc&) {
        return "bad_alloc";
    } catch (const std::runtime_error& error) {
        return error.what();
    }
}

std::string nested(int depth)
{
    std::string text;
    for (int i = 0; i < depth; i++)
        text += "<a>";
    for (int i = 0; i < depth; i++)
        text += "</a>";
    return text;
}

} // namespace

TEST(ApexConfig, IsWrittenElementByElement)
{
    EXPECT_EQ(written(two_entries()), "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n"
                                      "<ApexConfig>\n"
                                      "\t<theSystem>\n"
                                      "\t\t<ApexVersion>1.0</ApexVersion>\n"
                                      "\t\t<CreationDate>20260101120000.000000+060</CreationDate>\n"
                                      "\t\t<HostName>storage1</HostName>\n"
                                      "\t\t<Adapter>Norvane-FC2162-0</Adapter>\n"
                                      "\t</theSystem>\n"
                                      "\t<Configuration>\n"
                                      "\t\t<numberOfEntries>2</numberOfEntries>\n"
                                      "\t\t<Row>\n"
                                      "\t\t\t<src_wwpn>10000000C9A00001</src_wwpn>\n"
                                      "\t\t\t<tgt_wwpn>50060E8005A10000</tgt_wwpn>\n"
                                      "\t\t\t<reserved1>00000000000000000000000000000000</reserved1>\n"
                                      "\t\t\t<tag>7</tag>\n"
                                      "\t\t\t<reserved2>000000</reserved2>\n"
                                      "\t\t</Row>\n"
                                      "\t\t<Row>\n"
                                      "\t\t\t<src_wwpn>10000000C9ABCDEF</src_wwpn>\n"
                                      "\t\t\t<tgt_wwpn>FFFFFFFFFFFFFFFF</tgt_wwpn>\n"
                                      "\t\t\t<reserved1>00000000000000000000000000000000</reserved1>\n"
                                      "\t\t\t<tag>255</tag>\n"
                                      "\t\t\t<reserved2>000000</reserved2>\n"
                                      "\t\t</Row>\n"
                                      "\t</Configuration>\n"
                                      "</ApexConfig>\n\n");
}

TEST(ApexConfig, ComesBackAsItWasWritten)
{
    const Tag_Table table = readApexConfig(written(two_entries()));
    ASSERT_EQ(table.size(), 2u);
    EXPECT_EQ(number(table[0].source), 0x10000000C9A00001u);
    EXPECT_EQ(number(table[0].target), 0x50060E8005A10000u);
    EXPECT_EQ(table[0].tag, 7);
    EXPECT_EQ(number(table[1].source), 0x10000000C9ABCDEFu);
    EXPECT_EQ(number(table[1].target), 0xFFFFFFFFFFFFFFFFu);
    EXPECT_EQ(table[1].tag, 255);
}

TEST(ApexConfig, ALargestTableComesBack)
{
    Tag_Table most = makeTagTable(65536);
    for (uint32 i = 0; i < most.size(); i++) {
        most[i].source = wwn(0x1000000000000000 + i);
        most[i].target = wwn(0x5000000000000000 + i);
        most[i].tag = static_cast<uint8>(i);
    }
    const Tag_Table table = readApexConfig(written(most));
    ASSERT_EQ(table.size(), 65536u);
    for (uint32 i = 0; i < table.size(); i++) {
        ASSERT_EQ(number(table[i].source), 0x1000000000000000u + i);
        ASSERT_EQ(number(table[i].target), 0x5000000000000000u + i);
        ASSERT_EQ(table[i].tag, i % 256);
    }
}

TEST(ApexConfig, WritesNoMoreEntriesThanThereAre)
{
    Tag_Table table = two_entries();
    table.get()->count = 4000000000u;
    EXPECT_EQ(written(table), written(two_entries()));
}

TEST(ApexConfig, NamesOfTheHostAreEscaped)
{
    const std::string text = apexConfigText(two_entries(), {"now", "a<b>&\"c\"", "'"});
    EXPECT_THAT(text, HasSubstr("<HostName>a&lt;b&gt;&amp;&quot;c&quot;</HostName>"));
    EXPECT_THAT(text, HasSubstr("<Adapter>&apos;</Adapter>"));
    EXPECT_EQ(failure(text), "");
}

TEST(ApexConfig, DigitsAreReadInEitherCaseAndReservedBytesIgnored)
{
    const Tag_Table table =
        readApexConfig(with("<numberOfEntries>1</numberOfEntries><Row><src_wwpn>10000000c9abcDEF</src_wwpn>"
                            "<tgt_wwpn>50060e8005a10000</tgt_wwpn><reserved1>FFFF</reserved1><tag>3</tag>"
                            "<reserved2>FFFFFF</reserved2></Row>"));
    ASSERT_EQ(table.size(), 1u);
    EXPECT_EQ(number(table[0].source), 0x10000000C9ABCDEFu);
    for (const uint8 byte : table[0].reserved0)
        EXPECT_EQ(byte, 0);
    for (const uint8 byte : table[0].reserved1)
        EXPECT_EQ(byte, 0);
}

TEST(ApexConfig, ATagKeepsItsLowByte)
{
    const std::pair<const char*, int> tags[] = {
        {"300", 44}, {"256", 0}, {"-1", 255}, {" 12", 12}, {"12x", 12},
        {"x", 0},    {"", 0},    {"0x10", 0}, {"010", 10}, {"99999999999999999999", 255}};
    for (const auto& [text, tag] : tags) {
        const Tag_Table table = readApexConfig(with("<numberOfEntries>1</numberOfEntries>" + one_row(text)));
        EXPECT_EQ(table[0].tag, tag) << text;
    }
}

TEST(ApexConfig, RowsBeyondTheNumberAreIgnored)
{
    const Tag_Table table =
        readApexConfig(with("<numberOfEntries>2</numberOfEntries>" + one_row("1") + one_row("2") + "<Row/>"));
    ASSERT_EQ(table.size(), 2u);
    EXPECT_EQ(table[1].tag, 2);
}

TEST(ApexConfig, EntriesWithoutARowAreZero)
{
    const Tag_Table table = readApexConfig(with("<numberOfEntries>3</numberOfEntries>" + one_row("1") + one_row("2")));
    ASSERT_EQ(table.size(), 3u);
    EXPECT_EQ(table[1].tag, 2);
    EXPECT_EQ(number(table[2].source), 0u);
    EXPECT_EQ(number(table[2].target), 0u);
    EXPECT_EQ(table[2].tag, 0);
}

TEST(ApexConfig, OtherElementsMayStandInBetween)
{
    const Tag_Table table =
        readApexConfig("<?xml version='1.0'?><!DOCTYPE a [<!ENTITY b 'c'>]><!-- <a> --><?php <a> ?><Other/>"
                       "<ApexConfig a='<' "
                       "b=\">\"><Other/><theSystem><Other/><ApexVersion/><Other/><CreationDate/><HostName/><Adapter/>"
                       "</theSystem><Other/><Configuration><Other/><numberOfEntries>2</numberOfEntries><Other/>" +
                       one_row("1") + "<Other/>" + one_row("2") + "</Configuration></ApexConfig>");
    ASSERT_EQ(table.size(), 2u);
    EXPECT_EQ(table[1].tag, 2);
}

TEST(ApexConfig, EachElementMustBeThere)
{
    struct Missing {
        const char* name;
        const char* words;
    };
    const Missing all[] = {
        {"ApexConfig", "apexConfigNode"},
        {"theSystem", "theSystemNode"},
        {"ApexVersion", "apexVersionNode"},
        {"CreationDate", "creationTimeNode"},
        {"HostName", "hostNameNode"},
        {"Adapter", "adapterNode"},
        {"Configuration", "configurationNode"},
        {"numberOfEntries", "numberOfEntriesNode"},
        {"Row", "rowNode"},
    };
    for (const Missing& missing : all) {
        std::string text = with("<numberOfEntries>1</numberOfEntries>" + one_row());
        // Another name in its place.
        for (std::size_t at; (at = text.find(missing.name)) != std::string::npos;)
            text[at] = 'x';
        EXPECT_EQ(failure(text), std::string(missing.words) + " is not found or corrupted in the Apex config table");
    }
    EXPECT_EQ(failure(""), "apexConfigNode is not found or corrupted in the Apex config table");
    EXPECT_EQ(failure("<apexconfig/>"), "apexConfigNode is not found or corrupted in the Apex config table");
}

TEST(ApexConfig, EachElementMustStandInItsOrder)
{
    const std::string number = "<numberOfEntries>1</numberOfEntries>";
    const auto misses = [](const std::string& words) {
        return words + " is not found or corrupted in the Apex config table";
    };
    EXPECT_EQ(failure(with(one_row() + number)), misses("rowNode"));
    EXPECT_EQ(failure("<ApexConfig><Configuration>" + number + one_row() +
                      "</Configuration><theSystem><ApexVersion/><CreationDate/><HostName/><Adapter/></theSystem>"
                      "</ApexConfig>"),
              misses("configurationNode"));
    EXPECT_EQ(failure("<ApexConfig><theSystem><CreationDate/><ApexVersion/><HostName/><Adapter/></theSystem>"
                      "<Configuration>" +
                      number + one_row() + "</Configuration></ApexConfig>"),
              misses("creationTimeNode"));
    EXPECT_EQ(failure("<ApexConfig><theSystem><ApexVersion/><CreationDate/><Adapter/><HostName/></theSystem>"
                      "<Configuration>" +
                      number + one_row() + "</Configuration></ApexConfig>"),
              misses("adapterNode"));
    // Inside the wrong parent.
    EXPECT_EQ(failure("<x>" + with(number + one_row()) + "</x>"), misses("apexConfigNode"));
}

TEST(ApexConfig, ARowNeedsItsChildrenInOrder)
{
    const std::string number = "<numberOfEntries>2</numberOfEntries>" + one_row();
    const std::string source = "<src_wwpn>10000000C9A00001</src_wwpn>", tag = "<tag>1</tag>",
                      target = "<tgt_wwpn>10000000C9A00001</tgt_wwpn>";
    EXPECT_EQ(failure(with(number + "<Row/>")), "SetConfigTable::malformed src_wwpn field ");
    EXPECT_EQ(failure(with(number + "<Row>" + target + tag + "</Row>")), "SetConfigTable::malformed src_wwpn field ");
    EXPECT_EQ(failure(with(number + "<Row>" + source + tag + "</Row>")), "SetConfigTable::malformed tgt_wwpn field ");
    EXPECT_EQ(failure(with(number + "<Row>" + target + source + tag + "</Row>")),
              "SetConfigTable::malformed tgt_wwpn field ");
    EXPECT_EQ(failure(with(number + "<Row>" + source + target + "</Row>")), "SetConfigTable:: malformed tag field ");
    EXPECT_EQ(failure(with(number + "<Row>" + source + tag + target + "</Row>")),
              "SetConfigTable:: malformed tag field ");
    EXPECT_EQ(failure(with(number + "<Row>" + source + target + tag + "</Row>")), "");
}

TEST(ApexConfig, ANameThatIsNoneIsLoggedAndZero)
{
    for (const char* wrong : {"", "x", "10000000C9A0000", "10000000C9A000011", "10:00:00:00:C9:A0:00:01",
                              "10000000C9A0000g", " 10000000C9A00001", "<![CDATA[10000000C9A00001]]>"}) {
        Log_Capture log;
        const Tag_Table table =
            readApexConfig(with("<numberOfEntries>1</numberOfEntries>" + row("10000000C9A00001", wrong, "9")));
        EXPECT_EQ(number(table[0].source), 0x10000000C9A00001u) << wrong;
        EXPECT_EQ(number(table[0].target), 0u) << wrong;
        EXPECT_EQ(table[0].tag, 9) << wrong;
        EXPECT_THAT(log.words(), ElementsAre("INVALID WWN", "SetConfigTable::unable to convert string to hbaname "))
            << wrong;
    }
}

TEST(ApexConfig, EntitiesStandForTheirCharacters)
{
    const Tag_Table table = readApexConfig(with("<numberOfEntries>&#49;</numberOfEntries>" +
                                                row("1000&#x30;000C9A00001", "50060E8005A10000", "&#x31;&#50;")));
    ASSERT_EQ(table.size(), 1u);
    EXPECT_EQ(number(table[0].source), 0x10000000C9A00001u);
    EXPECT_EQ(table[0].tag, 12);
    // One of a document type is not known, and stays text; there is nothing that could be expanded without end.
    EXPECT_EQ(failure("<!DOCTYPE x [<!ENTITY a \"&b;&b;&b;\"><!ENTITY b \"&a;&a;\">]>" +
                      with("<numberOfEntries>1</numberOfEntries>" + one_row("&a;"))),
              "");
    EXPECT_EQ(failure(with("<numberOfEntries>1</numberOfEntries>" + one_row("&#1234567890123;"))),
              "invalid numeric character entity");
    EXPECT_EQ(failure(with("<numberOfEntries>1</numberOfEntries>" + one_row("&#49"))), "expected ;");
}

TEST(ApexConfig, TheNumberOfEntriesHasBounds)
{
    const auto read = [](const std::string& count) {
        return failure(with("<numberOfEntries>" + count + "</numberOfEntries>" + one_row()));
    };
    for (const char* count : {"-1", "65537", "4294967296", "99999999999999999999", "-99999999999999999999"}) {
        Log_Capture log;
        EXPECT_EQ(read(count), "bad_alloc") << count;
        EXPECT_THAT(log.words(), ElementsAre("SetConfigTable::Memory Allocation Failed ")) << count;
    }
    for (const char* count : {"65536", "0", "", "none", " 1", "1.9", "0x7FFFFFFF"})
        EXPECT_EQ(read(count), "") << count;
    EXPECT_EQ(readApexConfig(with("<numberOfEntries>0</numberOfEntries>" + one_row())).size(), 0u);
    EXPECT_EQ(readApexConfig(with("<numberOfEntries>0x7F</numberOfEntries>" + one_row())).size(), 0u);
}

TEST(ApexConfig, SixtyFourElementsMayBeNestedAndNoMore)
{
    EXPECT_EQ(failure(nested(64) + with("<numberOfEntries>1</numberOfEntries>" + one_row())), "");
    EXPECT_EQ(failure(nested(65)), "elements are nested too deeply");
    EXPECT_EQ(failure(nested(10000000)), "elements are nested too deeply");
    // Open ones are enough, and an empty one is an element too.
    std::string open;
    for (int i = 0; i < 64; i++)
        open += "<a b=\"c\">";
    EXPECT_EQ(failure(open), "unexpected end of data");
    EXPECT_EQ(failure(open + "<a/>"), "elements are nested too deeply");
    // What looks like one where none can be is none.
    std::string hidden = "<x>";
    for (int i = 0; i < 100; i++)
        hidden += "<!--<a>--><![CDATA[<a>]]><?pi <a>?><a b='<a>' c=\"<a>\"/>";
    EXPECT_EQ(
        failure("<!DOCTYPE a [[<a>]<a>]>" + hidden + "</x>" + with("<numberOfEntries>1</numberOfEntries>" + one_row())),
        "");
}

TEST(ApexConfig, AFileOfMoreTagsThanATableNeedsIsRefused)
{
    std::string text = "<a>";
    for (int i = 0; i < 1024 * 1024; i++)
        text += "<b/>";
    EXPECT_EQ(failure(text + "</a>"), "bad_alloc");
    text = "<a";
    for (int i = 0; i < 1024 * 1024; i++)
        text += " b=''";
    EXPECT_EQ(failure(text + "/>"), "bad_alloc");
    EXPECT_EQ(failure("<a>" + std::string(10 * 1024 * 1024, 'x') + "</a>"),
              "apexConfigNode is not found or corrupted in the Apex config table");
    EXPECT_EQ(failure(std::string(10 * 1024 * 1024, '<')), "expected >");
}

TEST(ApexConfig, AFileCutAnywhereIsRefused)
{
    const std::string whole = written(two_entries());
    const std::size_t end = whole.find("</ApexConfig>") + std::string("</ApexConfig>").size();
    for (std::size_t size = 0; size < end; size++)
        EXPECT_NE(failure(whole.substr(0, size)), "") << size;
    EXPECT_EQ(failure(whole.substr(0, end)), "");
}

TEST(ApexConfig, AByteOfAnotherValueAnywhereIsReadOrRefused)
{
    const std::string whole = written(two_entries());
    for (std::size_t at = 0; at < whole.size(); at++)
        for (const char other : {'\0', '<', '>', '&', '"', '/', '\xFF', '9'}) {
            std::string text = whole;
            text[at] = other;
            const std::string words = failure(text);
            EXPECT_NE(words, "bad_alloc") << at;
        }
}

TEST(ApexConfig, ZeroBytesEndTheText)
{
    const std::string whole = with("<numberOfEntries>1</numberOfEntries>" + one_row());
    EXPECT_EQ(failure(whole + '\0' + "<<<"), "");
    EXPECT_EQ(failure(std::string("\0", 1) + whole),
              "apexConfigNode is not found or corrupted in the Apex config table");
}

// The walk that looks for deep nesting must see the markup as the parser sees it, or it could be led astray.
TEST(ApexConfig, NoMarkupHidesItsDepth)
{
    const char* const pieces[] = {"<a>", "<a>",  "<a>",  "</a>", "</a>",      "<a/>", "<a b='", "'>",     "<a b=\"",
                                  "\">", "<!--", "-->",  "<!-",  "<![CDATA[", "]]>",  "<?",     "<?xml ", "?>",
                                  "<!",  ">",    "<",    "</",   "/>",        " ",    "x",      "=",      "<!DOCTYPE",
                                  " [",  "]",    "&lt;", "'",    "\"",        "[",    "<a ",    "b='>'"};
    std::mt19937 random(7);
    int deep = 0, parsed = 0;
    for (int round = 0; round < 200000; round++) {
        std::string text;
        const int count = 1 + static_cast<int>(random() % 24);
        for (int i = 0; i < count; i++)
            text += pieces[random() % (random() % 2 ? 5 : sizeof pieces / sizeof *pieces)];
        // Around it, 63 elements: one level is left.
        std::string open, close;
        for (int i = 0; i < 63; i++) {
            open += "<a>";
            close += "</a>";
        }
        std::string copy = text;
        rapidxml::xml_document<> document;
        std::size_t depth = 0;
        try {
            document.parse<0>(copy.data());
            const auto walk = [&](const auto& self, const rapidxml::xml_node<>& node, std::size_t level) -> void {
                for (const auto* child = node.first_node(); child; child = child->next_sibling())
                    if (child->type() == rapidxml::node_element) {
                        depth = std::max(depth, level);
                        self(self, *child, level + 1);
                    }
            };
            walk(walk, document, 1);
        } catch (const rapidxml::parse_error&) {
            continue;
        }
        parsed++;
        deep += depth > 1;
        const std::string words = failure(open + text + close);
        EXPECT_EQ(words == "elements are nested too deeply", depth > 1) << text << " has " << depth << ": " << words;
    }
    EXPECT_GT(parsed, 1000);
    EXPECT_GT(deep, 100);
}
