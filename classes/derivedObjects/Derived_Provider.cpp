#include "classes/derivedObjects/Derived_Provider.h"

#include "agent/enumerate.h"
#include "foundation/CLogger.h"

namespace cimple {

namespace {

/// The lines bear the name of the member's own source.
void logOperation(const Derived_Words& words, uint32 line, const char* operation)
{
    CLogger* logger = CLogger::instance();
    if (logger->wanted(NVR_DBG)) logger->log(words.file, line, NVR_DBG, "%s::%s()", words.name, operation);
}

} // namespace

int unloadDerived(const Derived_Words& words)
{
    logOperation(words, __LINE__, "unload");
    return ProviderAgent::unload();
}

void enumerateDerived(const Derived_Words& words, ProviderAgent& agent, const Instance_Map& source, bool is_san,
                      const Enum_Handler& handler)
{
    if (is_san)
        enumerateSAN(agent, source, handler);
    else
        enumeratePlain(agent, source, handler);
    logOperation(words, __LINE__, "enum_instances");
}

} // namespace cimple
