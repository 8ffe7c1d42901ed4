#include "tests/services/Transfer.h"

#include <algorithm>
#include <dlfcn.h>
#include <filesystem>
#include <unistd.h>

namespace nvrtest {

std::vector<std::pair<std::string, int>> opened;
std::map<std::string, std::string> led_to;
bool loader_refuses = false;

namespace {

int open_libraries = 0;

} // namespace
} // namespace nvrtest

extern "C" {
void* __real_dlopen(const char* path, int mode);
int __real_dlclose(void* library);

void* __wrap_dlopen(const char* path, int mode)
{
    nvrtest::opened.emplace_back(path, mode);
    const auto other = nvrtest::led_to.find(path);
    void* const library = __real_dlopen(other == nvrtest::led_to.end() ? path : other->second.c_str(), mode);
    nvrtest::open_libraries += library != nullptr;
    return library;
}

int __wrap_dlclose(void* library)
{
    nvrtest::open_libraries--;
    const int result = __real_dlclose(library);
    return nvrtest::loader_refuses ? -1 : result;
}
}

namespace nvrtest {

Words joined(const std::vector<Words>& parts)
{
    Words all;
    for (const Words& part : parts)
        all.insert(all.end(), part.begin(), part.end());
    return all;
}

Words version_words()
{
    void* const library = __real_dlopen(system_curl().c_str(), RTLD_NOW | RTLD_LOCAL);
    const auto version = reinterpret_cast<char* (*)()>(::dlsym(library, "curl_version"));
    const Words words = {"Found curl_version function", std::string("Curl version = ") + version()};
    __real_dlclose(library);
    return words;
}

std::string linking_error(const Words& all, const std::string& entry)
{
    const auto is_it = [&](const std::string& word) {
        return word.rfind("A dynamic linking error occurred:(", 0) == 0 && word.find(entry + ')') != std::string::npos;
    };
    const auto found = std::find_if(all.begin(), all.end(), is_it);
    return found == all.end() ? "the loader's words for " + entry : *found;
}

Words names_in(const std::string& path)
{
    Words names;
    for (const auto& entry : std::filesystem::directory_iterator(path))
        names.push_back(entry.path().filename());
    return names;
}

Transfer::Transfer()
{
    make_folder(folder);
    make_folder(served);
    EXPECT_EQ(::chdir(folder.c_str()), 0);
    install_curl(); // so that it is in the process before libraries are counted
    install_no_curl();
    opened.clear();
    open_libraries = 0;
}

Transfer::~Transfer()
{
    EXPECT_EQ(open_libraries, 0) << "libraries stay open";
    EXPECT_THAT(open_files(), testing::IsEmpty());
    if (!stand_in) return;
    EXPECT_EQ(stand_in->handles_ended, stand_in->handles - unended_handles);
    EXPECT_EQ(stand_in->global_cleanups, stand_in->global_inits - uncleaned_globals);
}

Words Transfer::open_files()
{
    Words files;
    for (const auto& descriptor : std::filesystem::directory_iterator("/proc/self/fd")) {
        std::error_code gone;
        const std::string file = std::filesystem::read_symlink(descriptor, gone);
        if (file.rfind(folder, 0) == 0 || file.rfind(served, 0) == 0) files.push_back(file);
    }
    return files;
}

void Transfer::use_stand_in(const std::string& lacking)
{
    stand_in = &install_curl_without(lacking);
    open_libraries = 0; // that one stays
}

Words Transfer::words()
{
    Words said = log.words();
    log.clear();
    return said;
}

} // namespace nvrtest
