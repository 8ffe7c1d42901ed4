// The table of the command's actions, the words of their numbers, and the question before them.
#include <cstdlib>
#include <fcntl.h>
#include <set>
#include <sstream>
#include <unistd.h>

#include <gmock/gmock.h>

#include "host/Schema.h"
#include "host/command/Actions.h"
#include "host/command/Dialogue.h"
#include "host/command/Meanings.h"

using namespace host;
using testing::HasSubstr;

namespace {

std::shared_ptr<const Schema> module_schema()
{
    std::string error;
    auto schema = Schema::from_files({NVR_MOF_DIR}, error);
    EXPECT_TRUE(schema) << error;
    return schema;
}

} // namespace

// A row that names what the classes do not have would fail only when somebody runs it.
TEST(ActionTable, NamesWhatTheClassesHave)
{
    const auto schema = module_schema();
    for (const Action& action : actions()) {
        const std::string name = action.group + ' ' + action.verb;
        const Class_Record* record = schema->find(action.service.empty() ? "NVRHBA_FCPort" : action.service);
        ASSERT_TRUE(record) << name;
        if (action.own) continue;
        const Method_Record* method = record->method(action.method);
        EXPECT_EQ(method == nullptr, action.service.empty()) << name;
        std::set<std::string> parameters;
        for (const Input& input : action.inputs)
            parameters.insert(input.parameter);
        for (const Choice& fixed : action.fixed)
            parameters.insert(fixed.word);
        for (const std::string& parameter : parameters) {
            const Element_Record* element = method ? method->find_parameter(parameter) : record->property(parameter);
            ASSERT_TRUE(element) << name << ' ' << parameter;
            if (method)
                EXPECT_TRUE(element->in) << name << ' ' << parameter;
            else
                EXPECT_TRUE(element->writable) << name << ' ' << parameter;
        }
        for (const auto& [out, meanings] : action.out_meanings)
            EXPECT_TRUE(method && method->find_parameter(out) && method->find_parameter(out)->out)
                << name << ' ' << out;
        for (const auto& [out, bits] : action.out_bits)
            EXPECT_TRUE(method && method->find_parameter(out) && method->find_parameter(out)->out)
                << name << ' ' << out;
    }
}

TEST(ActionTable, HasEachVerbOnceInAGroupThatHelpShows)
{
    std::set<std::string> groups, verbs;
    for (const auto& [group, help] : action_groups()) {
        EXPECT_TRUE(groups.insert(group).second) << group;
        EXPECT_FALSE(help.empty());
    }
    for (const Action& action : actions()) {
        EXPECT_EQ(groups.count(action.group), 1u) << action.group;
        EXPECT_TRUE(verbs.insert(action.group + ' ' + action.verb).second) << action.verb;
        EXPECT_FALSE(action.help.empty());
        for (const Input& input : action.inputs) {
            EXPECT_EQ(input.kind == Input::choice, !input.choices.empty() && input.kind != Input::flag) << input.label;
            if (input.kind == Input::flag) {
                EXPECT_EQ(input.choices.size(), 2u) << input.label;
            }
        }
    }
}

TEST(ReturnWords, AreThoseOfTheMethodBeforeTheCommonOnes)
{
    EXPECT_EQ(return_words({}, 0), "done");
    EXPECT_EQ(return_words({{0, "well done"}}, 0), "well done");
    EXPECT_EQ(return_words({{1, "other"}}, 0), "done");
    for (std::uint64_t value : {1u,     4u,     5u,     91u,    4097u,  4107u,  32767u, 32768u, 32774u, 32968u, 32969u,
                                33068u, 40001u, 40005u, 40089u, 40092u, 40097u, 40148u, 40149u, 40150u, 40221u, 40247u})
        EXPECT_NE(return_words({}, value), "a value without a meaning that is known") << value;
    EXPECT_EQ(return_words({}, 12), "a value without a meaning that is known");
    EXPECT_EQ(return_words({}, 40000), "a value without a meaning that is known");
    EXPECT_EQ(return_words({}, 4294967295), "a value without a meaning that is known");
    EXPECT_EQ(return_words({}, 40253), "the management library answered 253");
    EXPECT_THAT(return_words({}, 40221), HasSubstr("boot code"));
    EXPECT_EQ(return_words({{40247, "other"}}, 40247), "other");
}

TEST(ReturnWords, OfBitsAreJoined)
{
    const Meanings bits = {{1, "one"}, {4, "four"}};
    EXPECT_EQ(words_of_bits(bits, 0), "");
    EXPECT_EQ(words_of_bits(bits, 5), "one, four");
    EXPECT_EQ(words_of_bits(bits, 6), "four");
}

TEST(Question, TakesYesAloneForYes)
{
    for (const char* text : {"y\n", "Y\n", "yes\n", "Yes", "yo\n"}) {
        std::istringstream in(text);
        std::ostringstream out;
        EXPECT_TRUE(confirm("Really?", in, out)) << text;
        EXPECT_EQ(out.str(), "Really? [y/N] ");
    }
    for (const char* text : {"", "\n", "n\n", " y\n", "ja\n"}) {
        std::istringstream in(text);
        std::ostringstream out;
        EXPECT_FALSE(confirm("Really?", in, out)) << text;
    }
}

namespace {

/// Standard error led elsewhere while it lives.
class Led_Error {
public:
    explicit Led_Error(int to) : m_own(::dup(STDERR_FILENO)) { ::dup2(to, STDERR_FILENO); }
    ~Led_Error()
    {
        ::dup2(m_own, STDERR_FILENO);
        ::close(m_own);
    }
    Led_Error(const Led_Error&) = delete;
    Led_Error& operator=(const Led_Error&) = delete;

private:
    const int m_own;
};

/// Reads on until the text has come.
std::string read_to(int from, const std::string& text)
{
    std::string all;
    char c;
    while (all.find(text) == std::string::npos && ::read(from, &c, 1) == 1)
        all += c;
    return all;
}

} // namespace

TEST(SignOfLife, IsALineOnATerminalThatGoesAwayAgain)
{
    const int master = ::posix_openpt(O_RDWR | O_NOCTTY);
    ASSERT_GE(master, 0);
    ASSERT_EQ(::grantpt(master), 0);
    ASSERT_EQ(::unlockpt(master), 0);
    const int terminal = ::open(::ptsname(master), O_RDWR | O_NOCTTY);
    ASSERT_GE(terminal, 0);
    {
        const Led_Error led(terminal);
        const Progress progress("resetting the adapter");
        EXPECT_THAT(read_to(master, " s"), testing::ContainsRegex("[|] resetting the adapter, [0-9]+ s"));
    }
    EXPECT_THAT(read_to(master, "\033[K"), testing::EndsWith("\r\033[K"));
    ::close(terminal);
    ::close(master);
}

TEST(SignOfLife, IsNotWrittenIntoAFile)
{
    int ends[2];
    ASSERT_EQ(::pipe2(ends, O_NONBLOCK), 0);
    {
        const Led_Error led(ends[1]);
        const Progress progress("resetting the adapter");
    }
    ::close(ends[1]);
    EXPECT_EQ(read_to(ends[0], "anything"), "");
    ::close(ends[0]);
}
