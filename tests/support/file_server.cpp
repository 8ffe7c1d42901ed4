#include "tests/support/file_server.h"

#include <cstdlib>
#include <fcntl.h>
#include <netinet/in.h>
#include <spawn.h>
#include <stdexcept>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

extern char** environ;

namespace nvrtest {

namespace {

/// Starts a program that the loader finds at the path; the descriptors become its standard input and output.
pid_t start(const std::vector<std::string>& command, int input, int output)
{
    std::vector<char*> arguments;
    for (const std::string& word : command)
        arguments.push_back(const_cast<char*>(word.c_str()));
    arguments.push_back(nullptr);
    posix_spawn_file_actions_t actions;
    ::posix_spawn_file_actions_init(&actions);
    if (input >= 0) ::posix_spawn_file_actions_adddup2(&actions, input, STDIN_FILENO);
    if (output >= 0) ::posix_spawn_file_actions_adddup2(&actions, output, STDOUT_FILENO);
    pid_t process = -1;
    const int error = ::posix_spawn(&process, arguments[0], &actions, nullptr, arguments.data(), environ);
    ::posix_spawn_file_actions_destroy(&actions);
    if (error != 0) throw std::runtime_error("cannot start " + command[0]);
    return process;
}

/// A certificate that names another host and that nobody has signed.
void make_certificate(const std::string& certificate, const std::string& key)
{
    const pid_t process = start({NVR_OPENSSL, "req", "-x509", "-newkey", "rsa:2048", "-nodes", "-batch", "-days", "1",
                                 "-subj", "/CN=elsewhere.test", "-keyout", key, "-out", certificate},
                                -1, -1);
    int status = 0;
    if (::waitpid(process, &status, 0) != process || status != 0) throw std::runtime_error("cannot make a certificate");
}

} // namespace

File_Server::File_Server(const std::string& kind, const std::string& folder)
{
    // No proxy of the machine stands between.
    ::setenv("no_proxy", "127.0.0.1", 1);
    std::vector<std::string> command = {NVR_PYTHON, NVR_FILE_SERVER, kind, folder};
    if (kind == "https") {
        const std::string certificate = "/var/log/certificate.pem", key = "/var/log/key.pem";
        make_certificate(certificate, key);
        command.insert(command.end(), {certificate, key});
    }
    int input[2], output[2];
    if (::pipe2(input, O_CLOEXEC) != 0 || ::pipe2(output, O_CLOEXEC) != 0) throw std::runtime_error("no pipes");
    m_process = start(command, input[0], output[1]);
    ::close(input[0]);
    ::close(output[1]);
    m_input = input[1];
    m_output = ::fdopen(output[0], "r");
    m_url = kind + "://127.0.0.1:" + line() + "/";
}

File_Server::~File_Server()
{
    ::close(m_input);
    ::waitpid(m_process, nullptr, 0);
    std::fclose(m_output);
}

std::string File_Server::next_request()
{
    return line();
}

std::string File_Server::line()
{
    char buffer[65536];
    if (!std::fgets(buffer, sizeof buffer, m_output)) throw std::runtime_error("the file server has ended");
    std::string line = buffer;
    if (!line.empty() && line.back() == '\n') line.pop_back();
    return line;
}

std::string deserted_url()
{
    // It stays bound, so that nobody else gets the port.
    const int socket = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t size = sizeof address;
    if (::bind(socket, reinterpret_cast<sockaddr*>(&address), sizeof address) != 0 ||
        ::getsockname(socket, reinterpret_cast<sockaddr*>(&address), &size) != 0)
        throw std::runtime_error("no address to leave");
    return "http://127.0.0.1:" + std::to_string(ntohs(address.sin_port)) + "/";
}

} // namespace nvrtest
