#include "foundation/Management_Session.h"

#include <condition_variable>
#include <exception>
#include <fcntl.h>
#include <memory>
#include <mutex>
#include <semaphore.h>
#include <thread>
#include <unistd.h>

#include <gmock/gmock.h>

#include "foundation/management_binding.h"
#include "tests/foundation/fakes/fake_libraries.h"
#include "tests/support/log_capture.h"
#include "tests/support/private_host.h"
#include "tests/support/short_memory.h"

using namespace cimple;
using namespace nvrtest;
using testing::ElementsAre;
using testing::StartsWith;

namespace {

struct Session : testing::Test {
    Session()
    {
        fake::install({"lrmapi"});
        loadLibraries();
        fake::operations().RM_InitLib = [this] {
            initialised++;
            return result;
        };
    }
    ~Session() override { unloadLibraries(); }

    const std::string guard = "/NVR_RM_INIT_LIB_" + std::to_string(::getpid());
    const std::string done = "/NVR_RM_INIT_LIB_DONE_" + std::to_string(::getpid());
    bool there(const std::string& name) const { return exists("/dev/shm/sem." + name.substr(1)); }

    int initialised = 0;
    int result = 0;
};

} // namespace

TEST_F(Session, InitialisesTheLibraryAndSaysSo)
{
    Log_Capture log;
    {
        Management_Session wrapper;
        EXPECT_EQ(initialised, 1);
        EXPECT_TRUE(there(guard));
        EXPECT_TRUE(there(done));
    }
    EXPECT_FALSE(there(guard));
    EXPECT_TRUE(there(done)) << "its name outlives the session";
    EXPECT_THAT(log.words(), ElementsAre("Constructor", "Setting Up for FIFO.. ",
                                         "Aquired Semaphore.. Running RM_InitLib " + guard + " ",
                                         "Aquired Completed Semaphore.. Running RM_InitLib " + done,
                                         "Signalling Completed Semaphore.. Running RM_InitLib",
                                         "Signaled Completed Semaphore.. Running RM_InitLib", "RMLIB initialized",
                                         "Destructor", "Value of Sem in destructor=3", "RMLIB uninitialzed"));
}

TEST_F(Session, EndsWithoutAskingForMemory)
{
    auto session = std::make_unique<Management_Session>();
    refuse_allocation(1);
    session.reset();
    EXPECT_FALSE(forget_refusal()) << "what it throws would end the process";
    EXPECT_FALSE(there(guard));
}

TEST_F(Session, RefusesToStandWhenTheLibraryDoes)
{
    for (int status : {1, 64}) {
        result = status;
        Log_Capture log;
        EXPECT_THROW(Management_Session(), std::exception);
        EXPECT_FALSE(there(guard));
        EXPECT_EQ(log.words().back(),
                  "Error : Initialization of RMLib:: RM_InitLib failed with[" + std::to_string(status) + "]");
    }
    result = 0;
    Management_Session wrapper;
    EXPECT_TRUE(there(guard)) << "a later one may succeed";
}

TEST_F(Session, WhoseLibraryThrowsLeavesTheGuardToTheNext)
{
    fake::operations().RM_InitLib = []() -> int { throw std::bad_alloc(); };
    EXPECT_THROW(Management_Session(), std::bad_alloc);
    EXPECT_FALSE(there(guard));
    fake::operations().RM_InitLib = [this] { return initialised++, 0; };
    Management_Session next; // would wait for ever
    EXPECT_EQ(initialised, 1);
}

TEST_F(Session, TakesANegativeResultForSuccess)
{
    result = -1;
    EXPECT_NO_THROW(Management_Session());
}

TEST_F(Session, WithoutALibraryIsRefused)
{
    unloadLibraries();
    fake::install({});
    loadLibraries();
    EXPECT_THROW(Management_Session(), std::exception);
}

TEST_F(Session, WithoutASemaphoreStandsUninitialised)
{
    make_folder("/dev/shm/sem." + guard.substr(1));
    Log_Capture log;
    {
        Management_Session wrapper;
    }
    EXPECT_EQ(initialised, 0);
    EXPECT_THAT(log.words(), ElementsAre("Constructor", "Setting Up for FIFO.. ", "RMLIB initialized", "Destructor",
                                         "RMLIB uninitialzed"));
}

TEST_F(Session, DoesWithoutTheSecondSemaphore)
{
    make_folder("/dev/shm/sem." + done.substr(1));
    EXPECT_NO_THROW(Management_Session());
    EXPECT_EQ(initialised, 1);
}

TEST_F(Session, ComesUpAgainAndAgain)
{
    for (int round = 1; round <= 10; round++) {
        Management_Session wrapper;
        EXPECT_EQ(initialised, round);
    }
}

TEST_F(Session, OfASecondInstanceInitialisesAgain)
{
    Management_Session first;
    {
        Management_Session second;
        EXPECT_EQ(initialised, 2);
    }
    EXPECT_FALSE(there(guard));
}

TEST_F(Session, TakesALeftOverSemaphoreForAnInstanceThatInitialises)
{
    sem_t* left_over = ::sem_open(guard.c_str(), O_CREAT, 0644, 4); // any value but 2; with less than 2 it would wait
    ASSERT_NE(left_over, SEM_FAILED);
    Log_Capture log;
    {
        Management_Session wrapper;
    }
    EXPECT_EQ(initialised, 0);
    EXPECT_THAT(log.words(),
                ElementsAre("Constructor", "Setting Up for FIFO.. ",
                            StartsWith("Waiting on Completed Semaphore.. To issue RM Calls.." + guard + ".. sem = "),
                            "Recieved signal on Completed Semaphore.. To issue RM Calls", "RMLIB initialized",
                            "Destructor", "Value of Sem in destructor=3", "RMLIB uninitialzed"));
    EXPECT_FALSE(there(guard));
    ::sem_close(left_over);
}

namespace {

// A log that tells when a word passes.
class Watched_Log : public Log_Capture {
public:
    explicit Watched_Log(std::string start) : m_start(std::move(start)) {}
    void logMessage(sint32 level, const char* file, uint32 line, const char* text) override
    {
        Log_Capture::logMessage(level, file, line, text);
        std::lock_guard<std::mutex> lock(m_mutex);
        if (std::string(text).rfind(m_start, 0) == 0) m_passed = true;
        m_condition.notify_all();
    }
    void wait()
    {
        std::unique_lock<std::mutex> lock(m_mutex);
        m_condition.wait(lock, [this] { return m_passed; });
    }

private:
    const std::string m_start;
    std::mutex m_mutex;
    std::condition_variable m_condition;
    bool m_passed = false;
};

} // namespace

TEST_F(Session, WaitsForTheInstanceThatInitialises)
{
    Watched_Log log("Waiting on Completed Semaphore.. To issue RM Calls.." + guard + ".. sem = ");
    std::unique_ptr<Management_Session> second;
    std::thread waiting;
    fake::operations().RM_InitLib = [&] {
        initialised++;
        waiting = std::thread([&] { second = std::make_unique<Management_Session>(); });
        log.wait();
        EXPECT_EQ(second, nullptr);
        return 0;
    };
    auto first = std::make_unique<Management_Session>();
    waiting.join();
    EXPECT_EQ(initialised, 1);
    EXPECT_THAT(log.words(), testing::Contains("Recieved signal on Completed Semaphore.. To issue RM Calls"));
    second.reset();
    EXPECT_THAT(log.words(), testing::Contains("Value of Sem in destructor=1"));
    first.reset();
    EXPECT_FALSE(there(guard));
}

TEST_F(Session, OfAWaitingInstanceStandsWhenTheInitialiserFails)
{
    Watched_Log log("Waiting on Completed Semaphore..");
    std::unique_ptr<Management_Session> second;
    std::thread waiting;
    fake::operations().RM_InitLib = [&] {
        waiting = std::thread([&] { second = std::make_unique<Management_Session>(); });
        log.wait();
        return 5;
    };
    EXPECT_THROW(Management_Session(), std::exception);
    waiting.join();
    EXPECT_NE(second, nullptr);
    second.reset();
    EXPECT_FALSE(there(guard));
}
