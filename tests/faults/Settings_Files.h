/// What an unload must leave in the module's two settings files: what clients were told is set.
///
///     Settings_Files files(20);              // the time-out, in minutes
///     ... the module is loaded ...
///     files.note_time_out(7, answer.ok());   // what a client did not get told may be set all the same
///     ... the module is unloaded ...
///     const std::string wrong = files.wrong();
///
/// For programs with a private host. The files are read where they say so.
#pragma once

#include <string>
#include <vector>

namespace nvrtest {

class Settings_Files {
public:
    /// Writes both, in words that the module reads and does not write: so a file that it has not written is told.
    explicit Settings_Files(unsigned time_out);

    void note_time_out(unsigned minutes, bool is_told);
    void note_log_state(bool is_enabled, bool is_told);
    /// Whether clients were told of the last change.
    bool is_sure_of_time_out() const { return m_conf.allowed.size() == 1; }
    bool is_sure_of_log_state() const { return m_dmp.allowed.size() == 1; }

    /// Which file holds what it should not, and that; empty if both are as they should be. Files that are as they were
    /// before the load are right only if they may be unwritten.
    std::string wrong(bool may_be_unwritten = false) const;

private:
    struct File {
        const char* path;
        std::string before;
        std::vector<std::string> allowed;

        void note(const std::string& content, bool is_told);
        std::string wrong(bool may_be_unwritten) const;
    };
    File m_conf, m_dmp;
};

} // namespace nvrtest
