// The log's settings file: "mode,level,enabled", and behind the line's end the trace file's path.

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <sys/stat.h>

#include "foundation/CLogger.h"
#include "foundation/NVR_FileLogger.h"
#include "foundation/open_file.h"
#include "runtime/Undisturbed.h"

namespace cimple {

const char* const log_settings_path = "/etc/norvane_fc_provider.dmp";

String CLogger::tracePath() const
{
    Hold hold;
    for (NVR_LoggerInterface* logger : m_loggers)
        if (auto* file = dynamic_cast<NVR_FileLogger*>(logger)) return file->getPath();
    return {};
}

bool CLogger::setTracePath(const char* path)
{
    Hold hold;
    for (NVR_LoggerInterface* logger : m_loggers)
        if (auto* file = dynamic_cast<NVR_FileLogger*>(logger)) return file->setPath(path) == 0;
    return true;
}

bool CLogger::writeSettings() const
{
    char line[40];
    std::snprintf(line, sizeof line, "%d,%d,%d\n", static_cast<int>(getMode()), getLevel(), isEnabled() ? 1 : 0);
    const String path = tracePath();
    return write_text(log_settings_path, line, {path.c_str(), path.size()});
}

void CLogger::saveSettings()
{
    Undisturbed undisturbed;
    bool written = false;
    {
        const Hold hold;
        written = m_ending || writeSettings();
    }
    m_unread = false;
    if (!written) NVR_LOG("Unable to open file for storing config data");
}

void CLogger::saveSettingsAtEnd()
{
    if (!m_unread) saveSettings();
}

void CLogger::saveSettingsAtExit()
{
    const Hold hold(std::try_to_lock);
    if (!hold.held()) return;
    m_ending = true;
    if (!m_unread) static_cast<void>(writeSettings());
}

void CLogger::loadSettings()
{
    Undisturbed undisturbed;
    struct stat status;
    if (::stat(log_settings_path, &status) != 0) {
        m_unread = errno != ENOENT;
        return;
    }
    Line_Reader file(log_settings_path);
    if (file.is_open())
        applySettings(file);
    else
        NVR_LOG("Unable to open config data file - %s", log_settings_path);
    m_unread = file.has_failed();
}

void CLogger::storeSettings()
{
    saveSettings();
    loadSettings();
    m_unread = false;
}

void CLogger::applySettings(Line_Reader& file)
{
    char line[20];
    if (!file.read(line)) return;
    char* rest = nullptr;
    const char* token = ::strtok_r(line, ",", &rest);
    if (!token) {
        NVR_LOG("Unable to read Log Mode from config data file - %s", log_settings_path);
        return;
    }
    const auto mode = static_cast<uint32>(std::strtol(token, nullptr, 10));
    if (mode > 4) {
        NVR_LOG("Invalid value for Log Mode from config data file -%s-%u", log_settings_path, mode);
        return;
    }
    token = ::strtok_r(nullptr, ",", &rest);
    if (!token) {
        NVR_LOG("Unable to read Log Level from config data file - %s", log_settings_path);
        return;
    }
    const auto level = static_cast<uint32>(std::strtol(token, nullptr, 10));
    if (level > 5) {
        NVR_LOG("Invalid value for Log Level from config data file -%s-%u", log_settings_path, level);
        return;
    }
    token = ::strtok_r(nullptr, ",", &rest);
    if (!token) {
        NVR_LOG("Unable to read Log Enabled from config data file - %s", log_settings_path);
        return;
    }
    const auto enabled = static_cast<sint32>(std::strtol(token, nullptr, 10));
    m_enabled = enabled; // a negative value stays, and counts as enabled
    if (enabled < 0) {
        NVR_LOG("Invalid value for Log Enabled from config data file - %s", log_settings_path);
        return;
    }

    char path[256] = "";
    if (mode == 2 || mode == 4) {
        if (!file.read(path)) return;
        if (char* end = std::strrchr(path, '\r')) *end = '\0';
        if (char* end = std::strrchr(path, '\n')) *end = '\0';
    }
    if (!setTracePath(path)) return; // always so for the other modes, whose empty path no file has
    setLevel(static_cast<sint32>(level));
    setMode(mode);
}

} // namespace cimple
