// The course of a polled test: every answer that a poll can bring, at every count that matters.

#include <gmock/gmock.h>

#include "diagnostics/Poll_Course.h"
#include "foundation/management_api.h"

using namespace cimple;
using Next = Poll_Course::Next;

namespace {

/// Answers a course so often as `poll` keeps it going, and gives what came last.
struct Played {
    int polls = 0;
    Next last = Next::poll;
};

Played play(Poll_Course& course, uint32 status, uint32 state)
{
    Played played;
    while (played.last == Next::poll && played.polls < 1000) {
        played.last = course.answered(status, state);
        played.polls++;
    }
    return played;
}

constexpr uint32 no_result = RM_STATUS_NO_RESULT_YET;

} // namespace

TEST(PollCourse, BeginsWithACounterOf121)
{
    Poll_Course course;
    EXPECT_EQ(course.counter(), 121);
    EXPECT_EQ(course.answered(no_result, RM_DIAG_RUNNING), Next::poll);
    EXPECT_EQ(course.counter(), 120);
}

TEST(PollCourse, CancelsATestThatRunsAtThe121stPoll)
{
    for (const uint32 status : {no_result, uint32{RM_STATUS_OK}})
        for (const uint32 state : {RM_DIAG_PENDING, RM_DIAG_RUNNING}) {
            Poll_Course course;
            const Played played = play(course, status, state);
            EXPECT_EQ(played.polls, 121);
            EXPECT_EQ(played.last, Next::cancel);
        }
}

TEST(PollCourse, GivesATestThatDoesNotTellItsStateOneMorePollAndNoCancel)
{
    for (const uint32 state : {0u, 3u, 4u, 5u, 6u, 7u, 0xFFFFFFFFu}) {
        Poll_Course course;
        const Played played = play(course, no_result, state);
        EXPECT_EQ(played.polls, 122) << state;
        EXPECT_EQ(played.last, Next::failed) << state;
    }
}

TEST(PollCourse, FinishesWithACompletedTestAlone)
{
    for (const uint32 state : {0u, 3u, 4u, 5u, 7u, 0xFFFFFFFFu}) {
        Poll_Course course;
        EXPECT_EQ(course.answered(RM_STATUS_OK, state), Next::failed) << state;
    }
    Poll_Course course;
    EXPECT_EQ(course.answered(RM_STATUS_OK, RM_DIAG_COMPLETED), Next::finished);
}

TEST(PollCourse, FailsWithEveryOtherStatusWhateverTheState)
{
    for (uint32 status = 1; status < 300; status++) {
        if (status == no_result) continue;
        Poll_Course course;
        EXPECT_EQ(course.answered(status, RM_DIAG_COMPLETED), Next::failed) << status;
        EXPECT_EQ(course.answered(status, RM_DIAG_RUNNING), Next::failed) << status;
    }
}

TEST(PollCourse, EndsWithACancelThatWorked)
{
    Poll_Course course;
    play(course, no_result, RM_DIAG_RUNNING);
    EXPECT_EQ(course.cancelled(0), Next::failed);
}

TEST(PollCourse, PollsOnceMoreAfterACancelThatFailed)
{
    for (const uint32 last_status : {no_result, uint32{RM_STATUS_OK}}) {
        Poll_Course course;
        play(course, no_result, RM_DIAG_RUNNING);
        EXPECT_EQ(course.cancelled(1), Next::poll);
        EXPECT_EQ(course.counter(), 0);
        EXPECT_EQ(course.answered(last_status, RM_DIAG_RUNNING), Next::failed);
    }
    Poll_Course course;
    play(course, no_result, RM_DIAG_RUNNING);
    course.cancelled(1);
    EXPECT_EQ(course.answered(RM_STATUS_OK, RM_DIAG_COMPLETED), Next::finished);
}
