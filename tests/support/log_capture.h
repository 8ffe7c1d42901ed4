/// A logger that keeps every message while it lives, for tests that link the rooms themselves. Link nvr_foundation.
///
///     Log_Capture log; run(); EXPECT_THAT(log.words(), contains_in_order({...}));
#pragma once

#include <string>
#include <vector>

#include "foundation/CLogger.h"
#include "tests/support/trace.h"

namespace nvrtest {

inline cimple::CLogger& logger()
{
    return *cimple::CLogger::instance();
}

/// This thread is within a capture: what that allocates is nobody's who logs.
inline thread_local bool keeps_log = false;

class Log_Capture : public cimple::NVR_LoggerInterface {
public:
    struct Record {
        cimple::sint32 level;
        std::string file;
        cimple::uint32 line;
        std::string text;
    };

    Log_Capture() { cimple::CLogger::instance()->attach(this); }
    ~Log_Capture() override { cimple::CLogger::instance()->detach(this); }

    void logMessage(cimple::sint32 level, const char* file, cimple::uint32 line, const char* text) override
    {
        keeps_log = true;
        m_records.push_back({level, file, line, text});
        keeps_log = false;
    }
    void open() override { m_opened++; }
    void close() override { m_closed++; }
    void clear() override { m_records.clear(); }

    std::vector<std::string> words() const
    {
        cimple::CLogger::Hold hold;
        std::vector<std::string> words;
        for (const Record& record : m_records)
            words.push_back(record.text);
        return words;
    }
    const std::vector<Record>& records() const { return m_records; }
    int opened() const { return m_opened; }
    int closed() const { return m_closed; }

private:
    std::vector<Record> m_records;
    int m_opened = 0;
    int m_closed = 0;
};

} // namespace nvrtest
