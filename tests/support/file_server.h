/// A server of files on the loopback address, which lives as long as the object: to fetch from and to bring to.
///
///     File_Server server("http", "/var/log/files");
///     fetch(server.url() + "image");
///
/// Kinds: "http", "https" (with a certificate that nobody should trust), "ftp" (anonymous).
#pragma once

#include <cstdio>
#include <string>
#include <sys/types.h>
#include <vector>

namespace nvrtest {

class File_Server {
public:
    /// Serves an existing folder. Throws std::runtime_error if it does not come up.
    File_Server(const std::string& kind, const std::string& folder);
    ~File_Server();
    File_Server(const File_Server&) = delete;
    File_Server& operator=(const File_Server&) = delete;

    /// "http://127.0.0.1:PORT/"
    const std::string& url() const { return m_url; }
    /// The next request that was answered, or will be: method, path and credentials ("GET /image -", "RETR image").
    std::string next_request();

private:
    std::string line();

    pid_t m_process = -1;
    int m_input = -1;
    std::FILE* m_output = nullptr;
    std::string m_url;
};

/// An address of the loopback at which nobody listens.
std::string deserted_url();

} // namespace nvrtest
