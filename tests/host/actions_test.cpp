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

// What changes the hardware or its fabric asks first; what lasts shows that it lives.
TEST(ActionTable, AsksBeforeEachChangeAndShowsWhatLasts)
{
    std::set<std::string> without_question, lasting;
    for (const Action& action : actions()) {
        if (action.question.empty()) without_question.insert(action.group + ' ' + action.verb);
        if (!action.doing.empty()) lasting.insert(action.group + ' ' + action.verb);
    }
    EXPECT_THAT(without_question, testing::ElementsAre("bootbios status", "dump list", "param list", "tag get",
                                                       "tag save", "wwn capability", "wwn read"));
    EXPECT_THAT(lasting, testing::ElementsAre("dump generate", "firmware install", "port reset", "tag load",
                                              "wwn change", "wwn restore"));
}

TEST(ReturnWords, AreThoseOfTheMethodBeforeTheCommonOnes)
{
    EXPECT_EQ(return_words({}, 0), "done");
    EXPECT_EQ(return_words({{0, "well done"}}, 0), "well done");
    EXPECT_EQ(return_words({{1, "other"}}, 0), "done");
    EXPECT_EQ(return_words({}, 12), "a value without a meaning that is known");
    EXPECT_EQ(return_words({}, 40000), "a value without a meaning that is known");
    EXPECT_EQ(return_words({}, 4294967295), "a value without a meaning that is known");
    EXPECT_EQ(return_words({}, 40253), "the management library answered 253");
    EXPECT_THAT(return_words({}, 40221), HasSubstr("boot code"));
    EXPECT_EQ(return_words({{40247, "other"}}, 40247), "other");
}

TEST(ReturnWords, AreKnownForEachValueThatAServiceReturns)
{
    const std::pair<std::uint64_t, const char*> rows[] = {
        {0, "done"},
        {1, "the library refused"},
        {4, "it was asked of the wrong service, or a file could not be written"},
        {5, "an option is none, or a file could not be looked at"},
        {91, "the name is that of a virtual port"},
        {4097, "something that is needed was not given"},
        {4107, "the file was not found"},
        {32767, "the adapter has no entries"},
        {32768, "there is no adapter, or it failed for a reason of its own"},
        {32774, "memory ran out"},
        {32968, "the port is unknown, or something that was given is not possible"},
        {32969, "a name is missing"},
        {33068, "it was asked of an instance that is not the host's service"},
        {40001,
         "the management library answered 1: the port is not local, or the library does not have the call, or it "
         "failed"},
        {40002, "the management library answered 2: not supported"},
        {40005, "the management library answered 5: no World Wide Name that can be used"},
        {40007, "the management library answered 7: more data available"},
        {40027, "the management library answered 27: the directory cannot be opened"},
        {40063, "the management library answered 63: diagnostics are not available"},
        {40089, "the management library answered 89: names of this type are not supported"},
        {40092, "the management library answered 92: management of World Wide Names is not available"},
        {40097, "the management library answered 97: management of World Wide Names is busy"},
        {40128, "the management library answered 128: not supported on this host"},
        {40148, "the management library answered 148: a command of the mailbox failed"},
        {40149, "the management library answered 149: a command of the mailbox timed out"},
        {40150, "the management library answered 150: the mailbox is busy"},
        {40160, "the management library answered 160: the configuration cannot be opened"},
        {40178, "the management library answered 178: the configuration cannot be written"},
        {40191, "the management library answered 191: the list is too long"},
        {40221, "the management library answered 221: boot code is enabled: disable it first"},
        {40247, "the management library answered 247: the firmware is written, and a restart of the host activates it"},
    };
    for (const auto& [value, words] : rows)
        EXPECT_EQ(return_words({}, value), words);
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
