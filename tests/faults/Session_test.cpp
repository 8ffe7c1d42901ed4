// The script itself: on a sound host all of it succeeds, and two sessions are the same.
#include <sstream>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "simulator/nvrsim.h"
#include "tests/faults/Session.h"
#include "tests/module/support/Instance_Text.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using testing::Contains;
using testing::HasSubstr;
using testing::IsEmpty;

namespace {

/// The simulator's log without the results: handles are numbered over the life of the process.
std::vector<std::string> library_calls()
{
    std::string log(nvrsim_log(nullptr, 0) + 1, '\0');
    log.resize(nvrsim_log(log.data(), log.size()));
    std::vector<std::string> calls;
    std::istringstream lines(log);
    for (std::string line; std::getline(lines, line);)
        calls.push_back(line.substr(0, line.rfind(' ')));
    return calls;
}

} // namespace

TEST(Session, SucceedsOnASoundHost)
{
    Session session;
    for (const Session::Part& part : Session::parts()) {
        session.run(part);
        ASSERT_THAT(session.failures(), IsEmpty()) << part.name;
    }
    EXPECT_THAT(session.rig().words(), Contains("Norvane Provider Unloaded"));
    EXPECT_THAT(session.rig().server().report().violations, IsEmpty());
    EXPECT_EQ(left_beside_strings(session.rig().server().report()), 0u) << session.rig().server().report().to_text();
    EXPECT_EQ(nvrsim_callbacks(), 0u);
    EXPECT_EQ(session.settings().wrong(), "");
}

TEST(Session, MakesTheSameLibraryCallsEachTime)
{
    std::vector<std::string> made[2];
    for (std::vector<std::string>& calls : made) {
        Session session;
        for (const Session::Part& part : Session::parts())
            session.run(part);
        calls = library_calls();
    }
    EXPECT_THAT(made[0], Contains("RM_ChangeWWN 10000000C9A00001"));
    EXPECT_EQ(made[0], made[1]);
}

TEST(Session, PublishesTheSameBeforeAndAfterAllThatChangesTheHost)
{
    Session session;
    session.run(Session::part("load"));
    const std::string first = session.published();
    EXPECT_THAT(first, HasSubstr("NVRHBA_TapeDrive"));
    EXPECT_THAT(first, HasSubstr("NVRHBA_VirtualFCPort"));
    for (const Session::Part& part : Session::parts()) {
        if (part.name == std::string("unload")) break;
        session.run(part);
    }
    EXPECT_EQ(difference(first, session.published()), "");
}
