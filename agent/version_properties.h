/// The numbers of a firmware version on a software identity, where its text has them.
#pragma once

#include <string>

#include "agent/instance_table.h"
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"

namespace cimple {

/// `what` stands in front of the log's words.
template <class T>
void setVersion(T& identity, const std::string& version, const char* what)
{
    NVR_LOG("%s- Parsing VersionString", what);
    NVR_Version parsed;
    if (parseVersion(version.c_str(), parsed) == 0) {
        set(identity.MajorVersion, parsed.major);
        set(identity.MinorVersion, parsed.minor);
        set(identity.RevisionNumber, parsed.revision);
        set(identity.BuildNumber, parsed.build);
        set(identity.ReleaseType, parsed.releaseType);
        set(identity.TestReleaseVersion, parsed.testRelease);
        NVR_LOG("%s- Parsing Success", what);
    }
    NVR_LOG("%s- Parsing Done", what);
}

} // namespace cimple
