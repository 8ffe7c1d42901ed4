#include "foundation/NVR_CIMLogger.h"

#include <cstdio>

#include "foundation/CLogger.h"

namespace cimple {

NVR_CIMLogger::NVR_CIMLogger()
{
    CLogger::instance()->attach(this);
}

NVR_CIMLogger::~NVR_CIMLogger()
{
    CLogger::instance()->detach(this);
}

void NVR_CIMLogger::logMessage(sint32 level, const char*, uint32, const char* text)
{
    if (!text || level > NVR_ERR) return;
    const uint32 mode = CLogger::instance()->getMode();
    if (mode != 1 && mode != 4) return;
    CLogger::Hold hold;
    NVR_CIMLogEntry entry;
    entry.level = static_cast<uint32>(level);
    entry.timeStamp = Datetime::now();
    std::snprintf(entry.text, sizeof entry.text, "[%s]", text);
    const uint32 index = static_cast<uint32>(m_lastIndex) + 1;
    if (m_entries.size() >= m_capacity)
        m_entries[index % m_capacity] = entry;
    else
        m_entries.push_back(entry);
    m_lastIndex = static_cast<sint32>(index);
}

void NVR_CIMLogger::clear()
{
    CLogger::Hold hold;
    m_entries.clear();
    m_lastIndex = -1;
}

void NVR_CIMLogger::getEntries(std::vector<NVR_CIMLogEntry>& entries) const
{
    CLogger::Hold hold;
    entries = m_entries;
}

} // namespace cimple
