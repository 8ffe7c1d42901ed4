#include "foundation/CLogger.h"

#include <algorithm>
#include <cstdarg>
#include <cstdio>
#include <exception>
#include <string>

#include "foundation/NVR_CIMLogger.h"
#include "foundation/NVR_FileLogger.h"
#include "foundation/NVR_SysLogger.h"
#include "runtime/Immortal.h"
#include "runtime/Mutex.h"
#include "runtime/Undisturbed.h"
#include "runtime/guarded.h"

namespace cimple {

std::atomic<NVR_SysLogger*> system_logger{nullptr};

namespace {

// Attached loggers whose limits are not known here, so that they must see every message.
std::atomic<unsigned> loggers_of_other_kinds{0};

thread_local bool holds_dispatch_mutex = false;

Mutex& dispatch_mutex()
{
    static Immortal<Mutex> mutex(false, "dispatch_mutex", Lock_Place::log);
    return *mutex;
}

bool of_known_kind(NVR_LoggerInterface* logger)
{
    return dynamic_cast<NVR_FileLogger*>(logger) || dynamic_cast<NVR_CIMLogger*>(logger) ||
           dynamic_cast<NVR_SysLogger*>(logger);
}

} // namespace

const char* logLevelName(sint32 level)
{
    static const char* const names[] = {"NVR_INVALID", "NVR_CRIT", "NVR_WARN", "NVR_ERR", "NVR_INFO", "NVR_DBG"};
    return level >= NVR_CRIT && level <= NVR_DBG ? names[level] : names[NVR_INVALID];
}

CLogger::Hold::Hold() : m_outermost(!holds_dispatch_mutex)
{
    if (m_outermost) {
        dispatch_mutex().lock();
        holds_dispatch_mutex = true;
    }
}

CLogger::Hold::Hold(std::try_to_lock_t) : m_outermost(!holds_dispatch_mutex && dispatch_mutex().lock_soon())
{
    if (m_outermost) holds_dispatch_mutex = true;
}

bool CLogger::Hold::held() const
{
    return holds_dispatch_mutex;
}

CLogger::Hold::~Hold()
{
    if (m_outermost) {
        holds_dispatch_mutex = false;
        dispatch_mutex().unlock();
    }
}

CLogger::CLogger()
{
    system_logger = nullptr;
}

CLogger* CLogger::instance()
{
    static Immortal<CLogger> logger;
    return &*logger;
}

bool CLogger::wanted(sint32 level) const
{
    if (level <= NVR_INFO || loggers_of_other_kinds != 0) return true;
    if (m_enabled == 0 && system_logger != nullptr) return false; // the system logger alone, which drops this level
    const uint32 mode = m_mode;
    return level == NVR_DBG && (mode == 2 || mode == 4); // the trace file's modes
}

void CLogger::log(const char* file, const uint32& line, sint32 level, const char* format, ...)
{
    if (holds_dispatch_mutex || !wanted(level)) return;
    Undisturbed undisturbed;
    char fixed[1024];
    va_list arguments;
    va_start(arguments, format);
    const int size = std::vsnprintf(fixed, sizeof fixed, format, arguments);
    va_end(arguments);
    if (size < 0) return;
    if (static_cast<unsigned>(size) < sizeof fixed) {
        dispatch(file, line, level, fixed);
        return;
    }
    std::string text;
    try {
        text.resize(static_cast<unsigned>(size));
    } catch (const std::exception&) {
        dispatch(file, line, level, fixed); // the beginning is better than nothing
        return;
    }
    va_start(arguments, format);
    std::vsnprintf(text.data(), text.size() + 1, format, arguments);
    va_end(arguments);
    dispatch(file, line, level, text.c_str());
}

void CLogger::dispatch(const char* file, uint32 line, sint32 level, const char* text)
{
    // A message is not worth an error, and destructors log.
    const auto hand_over = [&](NVR_LoggerInterface* logger) {
        guarded([&] { logger->logMessage(level, file, line, text); });
    };
    if (m_enabled == 0) {
        if (NVR_SysLogger* logger = system_logger) {
            hand_over(logger);
            return;
        }
    }
    Hold hold;
    for (NVR_LoggerInterface* logger : m_loggers)
        hand_over(logger);
}

int CLogger::attach(NVR_LoggerInterface* logger)
{
    Hold hold;
    if (std::find(m_loggers.begin(), m_loggers.end(), logger) != m_loggers.end()) return 0;
    m_loggers.push_back(logger);
    if (auto* system = dynamic_cast<NVR_SysLogger*>(logger)) system_logger = system;
    if (!of_known_kind(logger)) loggers_of_other_kinds++;
    return 1;
}

int CLogger::detach(NVR_LoggerInterface* logger)
{
    Hold hold;
    const auto place = std::find(m_loggers.begin(), m_loggers.end(), logger);
    if (place == m_loggers.end()) return 0;
    m_loggers.erase(place);
    if (!of_known_kind(logger)) loggers_of_other_kinds--;
    return 1;
}

void CLogger::detachAll()
{
    Hold hold;
    m_loggers.clear();
    system_logger = nullptr;
    loggers_of_other_kinds = 0;
}

void CLogger::setMode(uint32 mode)
{
    Undisturbed undisturbed;
    Hold hold;
    m_mode = mode;
    for (NVR_LoggerInterface* logger : m_loggers) {
        if (mode != 0)
            logger->open();
        else
            logger->close();
    }
}

void CLogger::setLevel(sint32 level)
{
    if (level >= NVR_CRIT && level <= NVR_DBG) m_level = level;
}

void CLogger::enable()
{
    sint32 disabled = 0;
    m_enabled.compare_exchange_strong(disabled, 1);
}

void CLogger::disable()
{
    m_enabled = 0;
}

void CLogger::clearAll()
{
    Undisturbed undisturbed;
    Hold hold;
    for (NVR_LoggerInterface* logger : m_loggers)
        logger->clear();
}

} // namespace cimple
