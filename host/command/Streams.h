/// The command's own way to standard output, apart from what a module prints.
///
/// A provider may write to standard output, as an operator sees it who runs a server in the foreground. The answer of
/// the command must stay whole beside it, so file descriptor 1 is turned elsewhere before a module is loaded.
#pragma once

#include <ostream>
#include <streambuf>

namespace host {

class Own_Output : private std::streambuf {
public:
    /// Takes standard output for itself. What others in the process write to it from now on goes to standard error if
    /// `shown`, else nowhere. One a process.
    explicit Own_Output(bool shown);
    /// Flushes; others' output stays turned away.
    ~Own_Output() override;
    Own_Output(const Own_Output&) = delete;
    Own_Output& operator=(const Own_Output&) = delete;

    /// Where the command's answer goes.
    std::ostream& stream() { return m_stream; }

private:
    int_type overflow(int_type character) override;
    int sync() override;

    char m_buffer[8192];
    int m_descriptor = -1;
    std::ostream m_stream;
};

} // namespace host
