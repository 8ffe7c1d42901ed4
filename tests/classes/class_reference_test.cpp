// The class reference as it was built: pages, links, and what they say of the module's own classes.
#include "agent/profiles.h"
#include "tests/classes/Expected.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <map>
#include <regex>
#include <set>

using namespace cimple;
using testing::HasSubstr;

namespace {

using Pages = std::map<std::string, std::string>; // by file name

Pages read_pages(const std::string& folder, const std::string& extension)
{
    Pages pages;
    for (const auto& entry : std::filesystem::directory_iterator(folder)) {
        if (entry.path().extension() != extension) continue;
        std::ifstream stream(entry.path());
        std::stringstream text;
        text << stream.rdbuf();
        pages[entry.path().filename().string()] = text.str();
    }
    return pages;
}

const Pages& markdown()
{
    static const Pages* const pages = new Pages(read_pages(REFERENCE_FOLDER, ".md"));
    return *pages;
}

std::vector<std::string> found(const std::string& text, const std::regex& pattern)
{
    std::vector<std::string> all;
    for (std::sregex_iterator at(text.begin(), text.end(), pattern), end; at != end; ++at)
        all.push_back((*at)[1]);
    return all;
}

/// Every link of the pages leads to a page, and to a place that this page has. Answers how many there are.
std::size_t expect_links_resolve(const Pages& pages, const std::regex& link)
{
    const std::regex place("id=\"([^\"]+)\"");
    std::map<std::string, std::set<std::string>> places;
    for (const auto& [name, text] : pages)
        for (const std::string& id : found(text, place))
            EXPECT_TRUE(places[name].insert(id).second) << name << " has two places " << id;
    std::size_t count = 0;
    for (const auto& [name, text] : pages)
        for (const std::string& target : found(text, link)) {
            count++;
            const auto hash = target.find('#');
            const std::string page = hash == 0 ? name : target.substr(0, hash);
            EXPECT_TRUE(pages.count(page)) << name << " leads to " << target;
            if (hash != std::string::npos) {
                EXPECT_TRUE(places[page].count(target.substr(hash + 1))) << name << " leads to " << target;
            }
        }
    return count;
}

/// The rows of the table below a heading, as (bold name, last cell).
std::map<std::string, std::string> table_below(const std::string& page, const std::string& heading)
{
    std::map<std::string, std::string> rows;
    const auto begin = page.find("\n## " + heading + "\n");
    if (begin == std::string::npos) return rows;
    std::istringstream lines(page.substr(begin + 1, page.find("\n## ", begin + 1) - begin));
    const std::regex row(R"(\| \*\*(\w+)\*\* \| .* \| (.*) \|)");
    std::smatch match;
    for (std::string line; std::getline(lines, line);)
        if (std::regex_match(line, match, row)) rows[match[1]] = match[2];
    return rows;
}

/// Letters and digits alone, in lower case.
std::string squeezed(const std::string& text)
{
    std::string result;
    for (const char c : text)
        if (std::isalnum(static_cast<unsigned char>(c)))
            result += static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    return result;
}

} // namespace

TEST(ClassReference, HasAPageForEachClassAndTwoIndices)
{
    for (const auto& row : expected::rows("classes.txt"))
        EXPECT_TRUE(markdown().count(row[0] + ".md")) << row[0];
    EXPECT_EQ(markdown().size(), 262u);
}

TEST(ClassReference, NamesEachPublishedClassInBothIndices)
{
    const auto rows = expected::rows("providers.txt");
    EXPECT_EQ(rows.size(), 141u);
    for (const auto& row : rows)
        for (const char* index : {"index.md", "names.md"})
            EXPECT_THAT(markdown().at(index), HasSubstr("| [" + row[0] + "](" + row[0] + ".md) | ")) << index;
}

TEST(ClassReference, LeadsNowhereButToItself)
{
    EXPECT_GT(expect_links_resolve(markdown(), std::regex("\\]\\(([^)]+)\\)")), 3000u);
}

TEST(ClassReference, DescribesEachOwnPropertyInMoreThanItsName)
{
    for (const auto& row : expected::rows("properties.txt")) {
        const auto table = table_below(markdown().at(row[0] + ".md"), "Own properties");
        const auto property = table.find(row[2]);
        ASSERT_NE(property, table.end()) << row[0] << "." << row[2];
        const std::string name = squeezed(row[2]), meaning = squeezed(property->second);
        EXPECT_NE(meaning, name) << row[0];
        EXPECT_GE(meaning.size(), 12u) << row[0] << "." << row[2] << ": " << property->second;
        EXPECT_EQ(property->second.find("  "), std::string::npos) << row[0] << "." << row[2];
    }
}

TEST(ClassReference, TellsTheEndsOfEachAssociation)
{
    for (const auto& row : expected::rows("references.txt")) {
        const std::string& page = markdown().at(row[0] + ".md");
        EXPECT_TRUE(table_below(page, "Ends").count(row[1])) << row[0] << "." << row[1];
        EXPECT_THAT(page, HasSubstr("| **" + row[1] + "** | [" + row[2] + "](" + row[2] + ".md) ref, key | "));
        EXPECT_THAT(markdown().at(row[2] + ".md"),
                    HasSubstr("| [" + row[0] + "](" + row[0] + ".md) | " + row[1] + " |"));
    }
}

TEST(ClassReference, IndexesByTheProfilesThatAreRegistered)
{
    const std::string& index = markdown().at("index.md");
    std::vector<std::string> headings = found(index, std::regex("\n## ([^\n]+)"));
    ASSERT_GT(headings.size(), profile_rows.size());
    for (std::size_t i = 0; i < profile_rows.size(); i++)
        EXPECT_EQ(headings[i], profile_rows[i].name);
}

TEST(ClassReference, IsTheSameInHtml)
{
    ASSERT_STRNE(REFERENCE_HTML_FOLDER, "") << "cmark-gfm, which makes it, was not found when the build was configured";
    const Pages html = read_pages(REFERENCE_HTML_FOLDER, ".html");
    EXPECT_EQ(html.size(), markdown().size());
    EXPECT_EQ(expect_links_resolve(html, std::regex("href=\"([^\"]+)\"")),
              expect_links_resolve(markdown(), std::regex("\\]\\(([^)]+)\\)")));
    const std::string& port = html.at("NVRHBA_FCPort.html");
    EXPECT_THAT(port, HasSubstr("<title>NVRHBA_FCPort</title>"));
    EXPECT_THAT(html.at("index.html"), HasSubstr("<title>Class reference</title>"));
    EXPECT_THAT(port, HasSubstr("<td><strong>LocationIndicator</strong></td>"));
    for (const auto& [name, text] : html)
        EXPECT_EQ(text.find("| "), std::string::npos) << name << " has a table that was not understood";
}
