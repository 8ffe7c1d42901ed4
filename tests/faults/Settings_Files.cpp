#include "tests/faults/Settings_Files.h"

#include <algorithm>

#include "tests/module/support/Rig.h"
#include "tests/support/private_host.h"

namespace nvrtest {

namespace {

std::string time_out_line(unsigned minutes)
{
    return "NVR_PROVIDER_CACHE_TIMEOUT = " + std::to_string(minutes) + '\n';
}

std::string written_conf(unsigned minutes)
{
    return "##################################################\n"
           "# Norvane HBA CIM Provider Configuration Settings #\n"
           "##################################################\n" +
           time_out_line(minutes) + refreshing_settings + "NVR_PROVIDER_REFRESH_SANDATA = TRUE\n";
}

// To the trace file, at the highest level.
std::string written_dmp(bool is_enabled)
{
    return std::string("2,5,") + (is_enabled ? '1' : '0') + '\n' + trace_path;
}

} // namespace

Settings_Files::Settings_Files(unsigned time_out)
    : m_conf{conf_path, time_out_line(time_out) + refreshing_settings, {written_conf(time_out)}},
      m_dmp{dmp_path, written_dmp(true) + '\n', {written_dmp(true)}}
{
    for (const File* file : {&m_conf, &m_dmp})
        write_file(file->path, file->before);
}

void Settings_Files::note_time_out(unsigned minutes, bool is_told)
{
    m_conf.note(written_conf(minutes), is_told);
}

void Settings_Files::note_log_state(bool is_enabled, bool is_told)
{
    m_dmp.note(written_dmp(is_enabled), is_told);
}

std::string Settings_Files::wrong(bool may_be_unwritten) const
{
    return m_conf.wrong(may_be_unwritten) + m_dmp.wrong(may_be_unwritten);
}

void Settings_Files::File::note(const std::string& content, bool is_told)
{
    if (is_told) allowed.clear();
    allowed.push_back(content);
}

std::string Settings_Files::File::wrong(bool may_be_unwritten) const
{
    const std::string now = read_file(path);
    const bool is_right = std::find(allowed.begin(), allowed.end(), now) != allowed.end();
    if (is_right || (may_be_unwritten && now == before)) return {};
    return std::string(path) + " loses what was set, it holds \"" + now + "\", not \"" + allowed.back() + "\"\n";
}

} // namespace nvrtest
