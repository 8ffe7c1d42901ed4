/// Where libcurl is looked for: it is never linked, so that a host without it lacks file transfers and nothing else.
#pragma once

namespace cimple {

/// Opens libcurl from the first of its places that has it, with all its symbols bound and global, logging each place
/// before it is tried. The caller closes it with closeLibrary. Null if none has it.
void* openCurl();

} // namespace cimple
