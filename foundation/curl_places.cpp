#include "foundation/curl_places.h"

#include <dlfcn.h>

#include "foundation/CLogger.h"

namespace cimple {

namespace {

struct Curl_Place {
    const char* words;
    const char* library;
};

constexpr Curl_Place places[] = {
    {"Searching for /lib Curl on the machine", "/lib/libcurl.so.4"},
    {"Searching for /usr/lib/ Curl on the machine", "/usr/lib/libcurl.so.4"},
    {"Checking with libcurl.so system location for libcurl", "libcurl.so"},
    {"Checking with curl.dll windows system location for libcurl", "curl.dll"},
};

} // namespace

void* openCurl()
{
    for (const Curl_Place& place : places) {
        NVR_LOG("%s", place.words);
        if (void* library = ::dlopen(place.library, RTLD_NOW | RTLD_GLOBAL)) return library;
    }
    return nullptr;
}

} // namespace cimple
