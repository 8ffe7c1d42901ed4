// The queue between the libraries' threads and the worker.
#include "logs/Alert_Queue.h"

#include <array>
#include <atomic>
#include <set>
#include <thread>
#include <vector>

#include <gmock/gmock.h>

#include "tests/support/log_capture.h"
#include "tests/support/short_memory.h"

using namespace cimple;
using namespace nvrtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace {

class AlertQueue : public testing::Test {
protected:
    AlertQueue() { CLogger::instance()->enable(); }
    ~AlertQueue() override
    {
        // Closed and empty, as a clean-up leaves it.
        queue.close();
        indication_data record;
        while (queue.pop(record)) {
        }
    }
    static indication_data numbered(uint32 number) { return {{}, HBA_EVENT_PORT_ONLINE, number}; }
    /// The numbers of all that are there, until the queue says that it is closed.
    std::vector<uint32> pop_all()
    {
        std::vector<uint32> numbers;
        indication_data record;
        while (queue.pop(record))
            numbers.push_back(record.fabricPortID);
        return numbers;
    }

    Alert_Queue& queue = Alert_Queue::instance();
};

} // namespace

TEST_F(AlertQueue, IsClosedUntilItIsOpened)
{
    EXPECT_TRUE(queue.isCleanUp());
    EXPECT_FALSE(queue.push(numbered(1)));
    EXPECT_THAT(pop_all(), IsEmpty());
    queue.open();
    EXPECT_FALSE(queue.isCleanUp());
    EXPECT_TRUE(queue.push(numbered(2)));
    queue.close();
    EXPECT_TRUE(queue.isCleanUp());
    EXPECT_FALSE(queue.push(numbered(3)));
    EXPECT_THAT(pop_all(), ElementsAre(2u)) << "what was taken is still given";
}

TEST_F(AlertQueue, GivesRecordsWholeAndInTheirOrder)
{
    queue.open();
    for (uint32 number = 0; number < 1000; number++)
        EXPECT_TRUE(queue.push({{{1, 2, 3, 4, 5, 6, 7, 8}}, HBA_EVENT_PORT_OFFLINE, number}));
    for (uint32 number = 0; number < 1000; number++) {
        indication_data record;
        ASSERT_TRUE(queue.pop(record));
        EXPECT_EQ(record.fabricPortID, number);
        EXPECT_EQ(record.eventType, static_cast<uint32>(HBA_EVENT_PORT_OFFLINE));
        EXPECT_EQ(record.portWWN.wwn[7], 8);
    }
}

TEST_F(AlertQueue, IsEmptyWhenItIsOpened)
{
    queue.open();
    queue.push(numbered(1));
    queue.close();
    queue.open();
    queue.push(numbered(2));
    queue.close();
    EXPECT_THAT(pop_all(), ElementsAre(2u));
}

TEST_F(AlertQueue, SaysWhatItDoes)
{
    queue.open();
    Log_Capture log;
    queue.push(numbered(1));
    indication_data record;
    queue.pop(record);
    queue.close();
    queue.push(numbered(2));
    queue.pop(record);
    EXPECT_THAT(log.words(), ElementsAre("sending the signal for thread to indicate", "waiting for signal to occur",
                                         "waiting for signal to occur"));
}

TEST_F(AlertQueue, ARecordWithoutMemoryIsDroppedAndTold)
{
    queue.open();
    Log_Capture log;
    long dropped = 0;
    // A block of the queue holds many records: one that needs another block is refused.
    for (uint32 number = 0; dropped == 0 && number < 100000; number++) {
        refuse_allocation(1);
        dropped += !queue.push(numbered(number));
        EXPECT_EQ(forget_refusal(), dropped != 0);
    }
    EXPECT_EQ(dropped, 1);
    EXPECT_EQ(log.words().back(), "Failed to allocate memory to queue the event");
    EXPECT_TRUE(queue.push(numbered(7)));
    queue.close();
    EXPECT_EQ(pop_all().back(), 7u);
}

TEST_F(AlertQueue, ARecordBeyondTheMostIsDroppedAndTold)
{
    queue.open();
    CLogger::instance()->disable(); // a million lines are nobody's business
    uint32 taken = 0;
    while (taken < Alert_Queue::most_records && queue.push(numbered(taken)))
        taken++;
    EXPECT_EQ(taken, 1048576u);
    CLogger::instance()->enable();
    Log_Capture log;
    EXPECT_FALSE(queue.push(numbered(taken)));
    EXPECT_THAT(log.words(), ElementsAre("Failed to allocate memory to queue the event"));
    indication_data record;
    ASSERT_TRUE(queue.pop(record));
    EXPECT_EQ(record.fabricPortID, 0u) << "the oldest stay";
    EXPECT_TRUE(queue.push(numbered(taken)));
    EXPECT_FALSE(queue.push(numbered(taken)));
    queue.open(); // which empties it
}

TEST_F(AlertQueue, APopWaitsForARecordAndForTheEnd)
{
    queue.open();
    std::vector<uint32> popped;
    std::atomic<std::size_t> count{0};
    std::thread worker([&] {
        indication_data record;
        while (queue.pop(record)) {
            popped.push_back(record.fabricPortID);
            count++;
        }
    });
    for (uint32 number = 0; number < 100; number++) {
        queue.push(numbered(number));
        while (count <= number) // so that each pop finds the queue empty
            std::this_thread::yield();
    }
    queue.close();
    worker.join();
    EXPECT_EQ(popped.size(), 100u);
}

TEST_F(AlertQueue, WhatManyThreadsPushIsPoppedOnceEach)
{
    constexpr uint32 pushers = 4, each = 20000;
    std::array<std::vector<uint32>, pushers> taken;
    std::vector<uint32> popped;
    for (int life = 0; life < 20; life++) {
        queue.open();
        std::thread worker([&] {
            indication_data record;
            while (queue.pop(record))
                popped.push_back(record.fabricPortID);
        });
        std::array<std::thread, pushers> threads;
        for (uint32 pusher = 0; pusher < pushers; pusher++)
            threads[pusher] = std::thread([&, pusher] {
                const uint32 first = static_cast<uint32>(life) * (pushers * each / 20) + pusher * (each / 20);
                for (uint32 number = first; number < first + each / 20; number++)
                    if (queue.push(numbered(number))) taken[pusher].push_back(number);
            });
        if (life % 2) queue.close(); // while they push
        for (std::thread& thread : threads)
            thread.join();
        queue.close();
        worker.join();
    }
    std::multiset<uint32> pushed;
    for (const auto& numbers : taken)
        pushed.insert(numbers.begin(), numbers.end());
    EXPECT_GE(pushed.size(), pushers * each / 2) << "all of the lives that were not cut short";
    EXPECT_TRUE(std::multiset<uint32>(popped.begin(), popped.end()) == pushed);
}
