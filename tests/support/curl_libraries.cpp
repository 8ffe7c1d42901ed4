#include "tests/support/curl_libraries.h"

#include <dlfcn.h>
#include <stdexcept>

#include "tests/support/private_host.h"

namespace nvrtest {

namespace {

std::string place()
{
    return library_folder() + "/libcurl.so";
}

} // namespace

std::string system_curl()
{
    return NVR_SYSTEM_CURL;
}

void install_curl()
{
    // What it and its own libraries keep to the end would count as lost if they were unloaded before.
    static void* const kept = ::dlopen(system_curl().c_str(), RTLD_NOW | RTLD_LOCAL);
    if (!kept) throw std::runtime_error("the system's libcurl does not open");
    make_link(system_curl(), place());
}

void install_no_curl()
{
    write_file(place(), "No library of this name is installed.\n");
}

Curl_Stand_In& install_curl_without(const std::string& entry)
{
    const std::string file = std::string(NVR_CURL_FOLDER) + "/libcurl_without_" + entry + ".so";
    make_link(file, place());
    void* const library = ::dlopen(file.c_str(), RTLD_NOW | RTLD_LOCAL);
    void* const record = library ? ::dlsym(library, "curl_stand_in") : nullptr;
    if (!record) throw std::runtime_error("no stand-in without " + entry);
    return *static_cast<Curl_Stand_In*>(record);
}

} // namespace nvrtest
