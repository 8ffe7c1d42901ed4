#include "foundation/NVR_FileLogger.h"

#include <cerrno>
#include <new>
#include <pthread.h>
#include <stdio_ext.h>
#include <sys/stat.h>

#include "foundation/CLogger.h"
#include "foundation/open_file.h"
#include "runtime/Datetime.h"
#include "runtime/Undisturbed.h"

namespace cimple {

namespace {

bool mode_uses_trace_file()
{
    const uint32 mode = CLogger::instance()->getMode();
    return mode == 2 || mode == 4;
}

} // namespace

NVR_FileLogger::NVR_FileLogger()
{
    CLogger::instance()->attach(this);
}

NVR_FileLogger::~NVR_FileLogger()
{
    CLogger::instance()->detach(this); // an agent that failed half-way may end without detachAll
    Undisturbed undisturbed;
    closeStream();
}

void NVR_FileLogger::logMessage(sint32 level, const char* file, uint32 line, const char* text)
{
    if (!mode_uses_trace_file()) return;
    CLogger::Hold hold;
    if (!m_stream || level > NVR_DBG) return;
    char time[Datetime::text_size];
    Datetime::now_pretty(time);
    // The letter l behind the number is part of the line, not of the conversion.
    std::fprintf(m_stream, "[threadid =%ul] [%s] [%s:%u][%s] %s\n", static_cast<unsigned>(::pthread_self()), time, file,
                 line, logLevelName(level), text);
    if (std::fflush(m_stream) != 0) {
        ::__fpurge(m_stream); // a full pipe or disk: this record is lost, the next one starts afresh
        std::clearerr(m_stream);
    }
}

void NVR_FileLogger::open()
{
    if (!mode_uses_trace_file()) return;
    Undisturbed undisturbed;
    CLogger::Hold hold;
    closeStream();
    if (!m_path.empty()) m_stream = open_file(m_path.c_str(), "a+").release();
}

void NVR_FileLogger::close()
{
    Undisturbed undisturbed;
    CLogger::Hold hold;
    if (!m_stream) return;
    closeStream();
    m_path.clear();
}

void NVR_FileLogger::clear()
{
    Undisturbed undisturbed;
    CLogger::Hold hold;
    if (!m_stream) return;
    closeStream();
    if (m_path.empty()) return;
    open_file(m_path.c_str(), "w").reset();
    m_stream = open_file(m_path.c_str(), "a+").release();
}

int NVR_FileLogger::setPath(const char* path)
{
    Undisturbed undisturbed;
    if (!path) return -1;
    CLogger::Hold hold;
    struct stat status;
    if (::stat(path, &status) == 0) {
        if (!(status.st_mode & S_IWUSR)) return -1;
    } else if (errno != ENOENT) {
        return -1;
    }
    String stored(path); // before anything changes: `path` may be our own text
    File file = open_file(path, "a+");
    if (!file && errno == ENOMEM) throw std::bad_alloc(); // no fault of the path: settings with it must not be given up
    if (!file) return -1;
    closeStream();
    m_stream = file.release();
    m_path = stored;
    return 0;
}

String NVR_FileLogger::getPath() const
{
    CLogger::Hold hold;
    return m_path;
}

void NVR_FileLogger::closeStream()
{
    if (!m_stream) return;
    std::fclose(m_stream);
    m_stream = nullptr;
}

} // namespace cimple
