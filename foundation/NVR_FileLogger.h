/// The trace file: one line for each record, "[threadid =...l] [time] [file:line][level] message".
///
/// Records in modes 2 and 4. Every operation runs under the dispatch mutex, so any thread may call it; no call can
/// block on the file, be it a FIFO without a reader or a full pipe: what cannot be written at once is dropped.
#pragma once

#include <cstdio>

#include "foundation/NVR_LoggerInterface.h"
#include "runtime/String.h"

namespace cimple {

class NVR_FileLogger final : public NVR_LoggerInterface {
public:
    NVR_FileLogger();
    ~NVR_FileLogger() override;
    NVR_FileLogger(const NVR_FileLogger&) = delete;
    NVR_FileLogger& operator=(const NVR_FileLogger&) = delete;

    void logMessage(sint32 level, const char* file, uint32 line, const char* text) override;
    /// Reopens the file of the stored path for appending, in modes 2 and 4 only.
    void open() override;
    /// Closes the file and forgets its path.
    void close() override;
    /// Truncates the open file.
    void clear() override;

    /// Opens `path` for appending and lets go of the file before. Result 0; -1 for a null path, one that cannot be
    /// looked up or opened, or a file without its owner's write permission: the file before then stays in use. Want of
    /// memory is std::bad_alloc.
    int setPath(const char* path);
    String getPath() const;

private:
    void closeStream();

    String m_path;
    std::FILE* m_stream = nullptr;
};

} // namespace cimple
