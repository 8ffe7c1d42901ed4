/// An adapter opened by name for a scope, and the way its records are read.
///
/// Handles are never kept or shared between threads: each read opens the adapter anew.
#pragma once

#include <cstring>
#include <string>

#include "foundation/management_binding.h"
#include "runtime/guarded.h"

namespace cimple {

class AdapterHandle {
public:
    /// Throws std::exception, logged, if the adapter cannot be opened.
    explicit AdapterHandle(const std::string& adapterName);
    /// Whatever the library makes of that. Throws only where the thread is being cancelled.
    ~AdapterHandle() noexcept(false)
    {
        guarded([&] { HBA_CloseAdapter(m_handle); });
    }
    AdapterHandle(const AdapterHandle&) = delete;
    AdapterHandle& operator=(const AdapterHandle&) = delete;

    operator HBA_HANDLE() const { return m_handle; }

    /// Has `read(record)` fill a zeroed record; stale data is refreshed and read once more. Result the last status.
    template <class Record, class Read>
    HBA_STATUS readRecord(Record& record, Read read) const
    {
        std::memset(&record, 0, sizeof record);
        HBA_STATUS status = read(&record);
        if (status != HBA_STATUS_ERROR_STALE_DATA) return status;
        HBA_RefreshInformation(m_handle);
        std::memset(&record, 0, sizeof record);
        return read(&record);
    }

    /// The record of the adapter's port `index`.
    HBA_STATUS readPort(uint32 index, HBA_PORTATTRIBUTES& record) const;

private:
    HBA_HANDLE m_handle;
};

} // namespace cimple
