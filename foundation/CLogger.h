/// The process-wide log dispatcher: takes every trace message of the module and hands it to the attached loggers.
///
/// Loggers are attached, not owned. Any thread may call any operation, from inside a logger too (a message that a
/// logger logs from inside its own operations is dropped). All operations on the list of loggers, and through it on the
/// loggers, run under one mutex; nothing is logged while it is held. No operation changes errno.
///
/// Modes: 0 closes all loggers; 1 only the CIM ring records; 2 only the trace file; 3 neither; 4 both. The system
/// logger does not look at the mode. The level is kept, stored and published; what is recorded depends on the fixed
/// limits of the loggers alone.
#pragma once

#include <atomic>
#include <mutex>
#include <vector>

#include "foundation/NVR_LoggerInterface.h"
#include "runtime/String.h"
#include "runtime/Type.h"

namespace cimple {

class Line_Reader;
class NVR_SysLogger;

enum NVR_LogLevel : sint32 { NVR_INVALID = 0, NVR_CRIT = 1, NVR_WARN = 2, NVR_ERR = 3, NVR_INFO = 4, NVR_DBG = 5 };

/// The name that a record shows for a level; "NVR_INVALID" for a number that is none.
const char* logLevelName(sint32 level);

/// Holds the mode, the level and the enabled flag between two lives of the process.
extern const char* const log_settings_path;

class CLogger {
public:
    static CLogger* instance();

    /// Formats by printf rules, without a limit, and hands the text to each logger in order of attachment, under the
    /// dispatch mutex. While logging is disabled and a system logger is attached, that one alone gets it, without the
    /// mutex: who ends the system logger sees to it that no other thread still logs below NVR_DBG. No cancellation
    /// point, whatever the loggers do.
    void log(const char* file, const uint32& line, sint32 level, const char* format, ...)
        __attribute__((format(printf, 5, 6)));

    /// False if no attached logger would record a message of this level now. Takes no lock.
    bool wanted(sint32 level) const;

    /// Results: 1, or 0 if the logger was attached already (attach) or not attached (detach). An NVR_SysLogger becomes
    /// the system logger when it is attached, and stays so until it ends or detachAll.
    int attach(NVR_LoggerInterface* logger);
    int detach(NVR_LoggerInterface* logger);
    void detachAll();

    /// Stores the mode, then tells every logger to open, or, for mode 0, to close.
    void setMode(uint32 mode);
    uint32 getMode() const { return m_mode; }
    /// Takes levels 1 to 5 and ignores others.
    void setLevel(sint32 level);
    sint32 getLevel() const { return m_level; }
    void enable();
    void disable();
    bool isEnabled() const { return m_enabled != 0; }
    void clearAll();

    /// Writes mode, level, enabled flag and the trace file's path (of the first attached NVR_FileLogger) to
    /// "/etc/norvane_fc_provider.dmp". That it cannot be written is logged and that is all.
    void saveSettings();
    /// The same at the end of a life, but for a file that could not be read and that nobody has written since: what it
    /// holds would be lost.
    void saveSettingsAtEnd();
    /// As at the end, for a process that ends: logs nothing, and leaves the file as it is if another thread keeps the
    /// dispatch mutex.
    void saveSettingsAtExit();

    /// Reads them back and applies them; a fault is logged, and what was not yet applied stays as it was. Modes 0, 1
    /// and 3 have no path, which no file logger accepts: of such a file only the enabled flag takes effect.
    void loadSettings();
    /// Both, for what a client has set: that is what is to be saved at the end, whatever became of the file meanwhile.
    /// Reading it back opens the trace file anew.
    void storeSettings();

    /// Holds the dispatch mutex for a scope. A thread that holds it already passes through, since the mutex itself is
    /// not recursive.
    class Hold {
    public:
        Hold();
        /// Does not wait for ever: held() tells.
        explicit Hold(std::try_to_lock_t);
        ~Hold();
        Hold(const Hold&) = delete;
        Hold& operator=(const Hold&) = delete;
        bool held() const;

    private:
        bool m_outermost;
    };

private:
    CLogger();
    void dispatch(const char* file, uint32 line, sint32 level, const char* text);
    bool setTracePath(const char* path);
    String tracePath() const;
    bool writeSettings() const;
    void applySettings(Line_Reader& file);

    std::atomic<uint32> m_mode{0};
    std::atomic<sint32> m_level{0};
    std::atomic<sint32> m_enabled{0};
    std::vector<NVR_LoggerInterface*> m_loggers;
    std::atomic<bool> m_unread{false}; ///< the settings file holds what nobody knows
    bool m_ending = false;             ///< the exit has written the settings: no other thread truncates them any more

    template <class>
    friend class Immortal;
};

} // namespace cimple

/// Logs at level 5 with the call site's file and line. The arguments are evaluated only when a logger would record the
/// message, so they must have no effects.
#define NVR_LOG(...)                                                                                                   \
    do {                                                                                                               \
        ::cimple::CLogger* const nvr_logger = ::cimple::CLogger::instance();                                           \
        if (nvr_logger->wanted(::cimple::NVR_DBG))                                                                     \
            nvr_logger->log(__FILE__, __LINE__, ::cimple::NVR_DBG, __VA_ARGS__);                                       \
    } while (0)
