#include "foundation/Management_Session.h"

#include <cerrno>
#include <cstdint>
#include <cstdio>
#include <exception>
#include <fcntl.h>
#include <semaphore.h>
#include <unistd.h>

#include "foundation/CLogger.h"
#include "foundation/management_binding.h"
#include "runtime/Immortal.h"
#include "runtime/Mutex.h"
#include "runtime/Undisturbed.h"

namespace cimple {

namespace {

// What all instances share. The names carry the process id, so that each process guards its own copy of the library.
struct Session {
    // Guards the rest; never held while waiting for the guard.
    Mutex mutex{false, "Management_Session", Lock_Place::innermost};
    sem_t* guard = nullptr; // null: not open
    int openings = 0;       // of the guard by this process, each of which needs a close
    sem_t* done = nullptr;  // made by the initialiser, used by nobody, left behind
    bool initialising = false;
};

Session& session()
{
    static Immortal<Session> session;
    return *session;
}

/// Of a semaphore. It asks for no memory, since a session has to end without any.
class Process_Name {
public:
    explicit Process_Name(const char* prefix)
    {
        std::snprintf(m_text, sizeof m_text, "%s%u", prefix, static_cast<uint32>(::getpid()));
    }
    const char* c_str() const { return m_text; }

private:
    char m_text[40];
};

Process_Name guard_name()
{
    return Process_Name("/NVR_RM_INIT_LIB_");
}

sem_t* open_guard(const Process_Name& name)
{
    sem_t* guard = ::sem_open(name.c_str(), O_CREAT, 0644, 2);
    if (guard == SEM_FAILED) return nullptr;
    Auto_Mutex lock(session().mutex);
    session().guard = guard;
    session().openings++;
    return guard;
}

void close_guard(sem_t* guard, const Process_Name& name)
{
    Auto_Mutex lock(session().mutex);
    ::sem_close(guard);
    ::sem_unlink(name.c_str());
    if (--session().openings == 0) session().guard = nullptr;
}

void wait_for(sem_t* semaphore)
{
    while (::sem_wait(semaphore) != 0 && errno == EINTR) {
    }
}

/// Gives the guard back that the initialiser took, so that the next instance does not wait for it for ever; and, unless
/// the session stands, the opening of it too.
class Guard_Return {
public:
    Guard_Return(sem_t* guard, const Process_Name& name) : m_guard(guard), m_name(name) {}
    ~Guard_Return()
    {
        ::sem_post(m_guard);
        if (!stands) close_guard(m_guard, m_name);
    }
    Guard_Return(const Guard_Return&) = delete;
    Guard_Return& operator=(const Guard_Return&) = delete;

    bool stands = false;

private:
    sem_t* m_guard;
    const Process_Name& m_name;
};

/// Throws what the library throws, and std::exception if it refuses.
void initialise(sem_t* guard, const Process_Name& name)
{
    Guard_Return given_back(guard, name);
    NVR_LOG("Aquired Semaphore.. Running RM_InitLib %s ", name.c_str());
    const Process_Name done_name("/NVR_RM_INIT_LIB_DONE_");
    sem_t* done = ::sem_open(done_name.c_str(), O_CREAT, 0644, 0);
    {
        Auto_Mutex lock(session().mutex);
        session().initialising = true;
        session().done = done;
    }
    NVR_LOG("Aquired Completed Semaphore.. Running RM_InitLib %s", done_name.c_str());
    const int status = RM_InitLib();
    if (status > 0) {
        NVR_LOG("Error : Initialization of RMLib:: RM_InitLib failed with[%d]", status);
        throw std::exception();
    }
    NVR_LOG("Signalling Completed Semaphore.. Running RM_InitLib");
    given_back.stands = true;
}

} // namespace

// The guard is made with the value 2. Who finds 2 initialises, with 1 in between, and puts it back to 2; who finds less
// takes what is left and waits for that.
Management_Session::Management_Session()
{
    const Undisturbed undisturbed; // a thread that ended here would leave the others to wait for ever
    NVR_LOG("Constructor");
    NVR_LOG("Setting Up for FIFO.. ");
    const Process_Name name = guard_name();
    if (sem_t* guard = open_guard(name)) {
        int value = 0;
        ::sem_getvalue(guard, &value);
        wait_for(guard);
        if (value == 2) {
            initialise(guard, name);
            NVR_LOG("Signaled Completed Semaphore.. Running RM_InitLib");
        } else {
            NVR_LOG("Waiting on Completed Semaphore.. To issue RM Calls..%s.. sem = %ul", name.c_str(),
                    static_cast<unsigned>(reinterpret_cast<std::uintptr_t>(guard)));
            wait_for(guard);
            NVR_LOG("Recieved signal on Completed Semaphore.. To issue RM Calls");
        }
    }
    NVR_LOG("RMLIB initialized");
}

void Management_Session::forgetName()
{
    ::sem_unlink(guard_name().c_str());
}

Management_Session::~Management_Session()
{
    NVR_LOG("Destructor");
    sem_t* guard = nullptr;
    {
        Auto_Mutex lock(session().mutex);
        guard = session().guard;
    }
    if (guard) {
        ::sem_post(guard);
        int value = 0;
        ::sem_getvalue(guard, &value);
        NVR_LOG("Value of Sem in destructor=%d", value);
        close_guard(guard, guard_name());
    }
    NVR_LOG("RMLIB uninitialzed");
}

} // namespace cimple
