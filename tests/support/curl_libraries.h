/// Which libcurl the loader finds as "libcurl.so". For programs with a private host.
#pragma once

#include <string>

#include "tests/support/curl_stand_in.h"

namespace nvrtest {

/// The system's own. From the first time on it stays in the process, whoever closes it.
void install_curl();
/// None: a file of that name that is no library.
void install_no_curl();
/// One that forwards to the system's own but lacks an entry ("nothing": has them all). The record is the library's,
/// which stays open; one a process for each entry.
Curl_Stand_In& install_curl_without(const std::string& entry);

/// The file of the system's own.
std::string system_curl();

} // namespace nvrtest
