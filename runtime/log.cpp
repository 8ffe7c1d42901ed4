#include "runtime/log.h"

#include <climits>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <new>
#include <stdio_ext.h>
#include <sys/stat.h>

#include "runtime/Datetime.h"
#include "runtime/File_Lock.h"
#include "runtime/Mutex.h"
#include "runtime/String.h"
#include "runtime/Undisturbed.h"

namespace cimple {

std::atomic<int> log_threshold{INT_MAX};

namespace {

constexpr const char* level_names[] = {"FATAL", "ERR", "WARN", "INFO", "DBG"};
constexpr int number_of_levels = 5;
constexpr int closed = -1;
constexpr std::size_t longest_line = 1024; // of the configuration file
constexpr int longest_file = 1024 * 1024;

// Guards what follows.
Mutex log_mutex(false, "log_mutex", Lock_Place::log);
bool log_asked = false; // opened, or found closed, once and for all
std::FILE* log_file = nullptr;
int log_lock_file = -1;
std::atomic<bool> warnings_enabled{true};

bool is_blank(char c)
{
    return c == ' ' || c == '\t';
}

const char* skip_blanks(const char* text)
{
    while (is_blank(*text))
        ++text;
    return text;
}

int level_of(const char* name)
{
    for (int level = 0; level < number_of_levels; ++level)
        if (equali(name, level_names[level])) return level;
    return closed;
}

// As fopen, but that nobody waits for the other end of a pipe.
std::FILE* open_stream(const String& path, int flags, const char* mode)
{
    const int file = open(path.c_str(), flags | O_NONBLOCK | O_NOCTTY | O_CLOEXEC, 0666);
    if (file == -1) return nullptr;
    std::FILE* stream = fdopen(file, mode);
    if (!stream) close(file);
    return stream;
}

// One line without its white space at the end; what a line has beyond its limit is dropped. `left` bytes are read at
// most.
bool read_line(std::FILE* file, char (&line)[longest_line + 1], int& left)
{
    std::size_t size = 0;
    int c = EOF;
    while (left-- > 0 && (c = std::getc(file)) != EOF && c != '\n')
        if (size < longest_line) line[size++] = static_cast<char>(c);
    if (c == EOF && size == 0) return false;
    while (size && (is_blank(line[size - 1]) || (line[size - 1] >= '\n' && line[size - 1] <= '\r')))
        --size;
    line[size] = '\0';
    return true;
}

// The value of a line "LOG_LEVEL = value", or null for another line.
const char* level_name_in(const char* line)
{
    constexpr std::size_t key_size = sizeof("LOG_LEVEL") - 1;
    if (std::strncmp(line, "LOG_LEVEL", key_size) != 0) return nullptr;
    line = skip_blanks(line + key_size);
    return *line == '=' ? skip_blanks(line + 1) : nullptr;
}

int configured_level(const String& path)
{
    std::FILE* file = open_stream(path, O_RDONLY, "r");
    if (!file) return closed;
    int level = 0;
    char line[longest_line + 1];
    int left = longest_file;
    while (left > 0 && read_line(file, line, left)) {
        if (line[0] == '#' || line[0] == '\0') continue;
        if (const char* name = level_name_in(line)) {
            level = level_of(name);
            break;
        }
    }
    std::fclose(file);
    return level;
}

String operator+(const String& a, const char* b)
{
    String sum(a);
    sum.append(b);
    return sum;
}

bool open_files(const String& folder)
{
    mkdir(folder.c_str(), 0777);
    log_lock_file = open((folder + "/messages.lock").c_str(), O_WRONLY | O_CREAT | O_NONBLOCK | O_CLOEXEC, 0600);
    if (log_lock_file == -1) return false;
    log_file = open_stream(folder + "/messages", O_WRONLY | O_CREAT | O_APPEND, "a");
    if (log_file) return true;
    close(log_lock_file);
    return false;
}

// The level up to which is logged, or `closed`.
int open_log()
{
    const char* home = std::getenv("CIMPLE_HOME");
    if (!home) return closed;
    const String folder = String(home) + "/.cimple";
    const int level = configured_level(folder + "rc");
    return level != closed && open_files(folder) ? level : closed;
}

void append_format(String& text, const char* format, std::va_list arguments)
{
    std::va_list again;
    va_copy(again, arguments);
    char buffer[512];
    const int size = std::vsnprintf(buffer, sizeof(buffer), format, arguments);
    if (size > 0 && static_cast<std::size_t>(size) < sizeof(buffer)) {
        text.append(buffer, static_cast<std::size_t>(size));
    } else if (size > 0) {
        if (char* large = static_cast<char*>(std::malloc(static_cast<std::size_t>(size) + 1))) {
            std::vsnprintf(large, static_cast<std::size_t>(size) + 1, format, again);
            text.append(large, static_cast<std::size_t>(size));
            std::free(large);
        }
    }
    va_end(again);
}

void append_format(String& text, const char* format, ...) __attribute__((format(printf, 2, 3)));
void append_format(String& text, const char* format, ...)
{
    std::va_list arguments;
    va_start(arguments, format);
    append_format(text, format, arguments);
    va_end(arguments);
}

void append_head(String& line, Log_Level level, const char* file, int at)
{
    char time[Datetime::text_size];
    Datetime::now_pretty(time);
    if (char* point = std::strchr(time, '.')) *point = '\0';
    append_format(line, "%s %s: %s(%d): ", time, level_names[level], file, at);
}

void write_line(const String& line)
{
    Auto_Mutex hold(log_mutex);
    File_Lock hold_file(log_lock_file);
    std::fwrite(line.c_str(), 1, line.size(), log_file);
    if (std::fflush(log_file) == 0) return;
    // A full disk costs this line, not the next ones.
    std::clearerr(log_file);
    __fpurge(log_file);
}

} // namespace

bool log_open_and_ask(Log_Level level)
{
    const Undisturbed undisturbed;
    if (log_threshold.load(std::memory_order_acquire) == INT_MAX) {
        Auto_Mutex hold(log_mutex);
        if (!log_asked) {
            int threshold = closed;
            try {
                threshold = open_log();
            } catch (const std::bad_alloc&) {
            }
            log_asked = true;
            log_threshold.store(threshold, std::memory_order_release);
        }
    }
    return level <= log_threshold.load(std::memory_order_acquire);
}

void log_write(Log_Level level, const char* file, int line, const char* format, ...)
{
    if (!log_wanted(level)) return;
    const Undisturbed undisturbed;
    std::va_list arguments;
    va_start(arguments, format);
    try {
        String text;
        append_head(text, level, file, line);
        append_format(text, format, arguments);
        if (text[text.size() - 1] != '\n') text.append('\n');
        write_line(text);
    } catch (const std::bad_alloc&) {
        // A message is not worth an error.
    }
    va_end(arguments);
}

void log_enable_warnings(bool enable)
{
    warnings_enabled.store(enable, std::memory_order_relaxed);
}

bool log_warnings_enabled()
{
    return warnings_enabled.load(std::memory_order_relaxed);
}

extern "C" {

void __cimple_trace(const char* file, int line, const char* message)
{
    std::fprintf(stderr, "TRACE: %s(%d): %s\n", file, line, message);
}

void __cimple_assert(const char* file, int line, const char* function, const char* expression)
{
    std::fprintf(stderr, "%s(%d): %s(): assert: %s\n\n", file, line, function, expression);
    std::abort();
}

} // extern "C"

} // namespace cimple
