// Files fetched and brought by libcurl: whatever the host has, whatever the address.
#include <array>
#include <dlfcn.h>
#include <filesystem>
#include <map>
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

#include <gmock/gmock.h>

#include "services/NVR_MethodWrapper.h"
#include "tests/support/curl_libraries.h"
#include "tests/support/file_server.h"
#include "tests/support/log_capture.h"
#include "tests/support/private_host.h"

using namespace cimple;
using namespace nvrtest;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::StartsWith;

namespace {

// What the code under test opens, and where that leads instead of where the loader would go.
std::vector<std::pair<std::string, int>> opened;
std::map<std::string, std::string> led_to;
int open_libraries = 0;
bool loader_refuses = false; // to close

} // namespace

extern "C" {
void* __real_dlopen(const char* path, int mode);
int __real_dlclose(void* library);

void* __wrap_dlopen(const char* path, int mode)
{
    opened.emplace_back(path, mode);
    const auto other = led_to.find(path);
    void* const library = __real_dlopen(other == led_to.end() ? path : other->second.c_str(), mode);
    open_libraries += library != nullptr;
    return library;
}

int __wrap_dlclose(void* library)
{
    open_libraries--;
    const int result = __real_dlclose(library);
    return loader_refuses ? -1 : result;
}
}

namespace {

using Words = std::vector<std::string>;

const std::string folder = "/var/log/here";   // where the program stands
const std::string served = "/var/log/served"; // what servers give
const Words search = {"Searching for /lib Curl on the machine", "Searching for /usr/lib/ Curl on the machine",
                      "Checking with libcurl.so system location for libcurl"};
const Words last_place = {"Checking with curl.dll windows system location for libcurl"};

Words joined(const std::vector<Words>& parts)
{
    Words all;
    for (const Words& part : parts)
        all.insert(all.end(), part.begin(), part.end());
    return all;
}

class Transfer : public testing::Test {
protected:
    Transfer()
    {
        make_folder(folder);
        make_folder(served);
        EXPECT_EQ(::chdir(folder.c_str()), 0);
        install_curl(); // so that it is in the process before libraries are counted
        install_no_curl();
        opened.clear();
        open_libraries = 0;
    }
    ~Transfer() override
    {
        EXPECT_EQ(open_libraries, 0) << "libraries stay open";
        EXPECT_THAT(open_files(), IsEmpty());
        if (stand_in) {
            EXPECT_EQ(stand_in->handles_ended, stand_in->handles - unended_handles);
            EXPECT_EQ(stand_in->global_cleanups, stand_in->global_inits - uncleaned_globals);
        }
    }

    /// Those of the test's folders that the process has open.
    static Words open_files()
    {
        Words files;
        for (const auto& descriptor : std::filesystem::directory_iterator("/proc/self/fd")) {
            std::error_code gone;
            const std::string file = std::filesystem::read_symlink(descriptor, gone);
            if (file.rfind(folder, 0) == 0 || file.rfind(served, 0) == 0) files.push_back(file);
        }
        return files;
    }

    void use_stand_in(const std::string& lacking = "nothing")
    {
        stand_in = &install_curl_without(lacking);
        open_libraries = 0; // that one stays
    }

    Curl_Stand_In* stand_in = nullptr;
    int unended_handles = 0, uncleaned_globals = 0; // what a library that lacks the entry for it keeps

    // The log says what it says in every test, so that no test passes by its result alone.
    Words words() { return log.words(); }

private:
    Log_Capture log;
};

/// The names in a folder.
Words names_in(const std::string& path)
{
    Words names;
    for (const auto& entry : std::filesystem::directory_iterator(path))
        names.push_back(entry.path().filename());
    return names;
}

// ------------------------------------------------------------------------------------------------------------ download

const Words download_begin = {"Inside NVR_MethodWrapper::downloadFileUsingCurl",
                              "File not found on local file system. Trying libcURL..."};
const Words options_words = {"CURL Error Code: 0 ",
                             "Set CURLOPT_FILE :Successfully sent CURLOPT_FILE to curl Library ",
                             "Set CURLOPT_FILE :Successfully sent CURLOPT_FILE to curl Library ",
                             "CURL Error Code: 0 ",
                             "CURLOPT_SSL_VERIFYPEER return code = 0",
                             "CURLOPT_SSL_VERIFYHOST return code = 0"};
const Words file_words = {"OPENED the curl library to download from internet"};
const Words begin_words = {"execute function curl_global_init in curl so",
                           "initialized the curl library to download from internet"};
const Words end_words = {"Found the function curl_easy_cleanup in curl so", "Successfully closed curl so"};

Words version_words()
{
    void* const library = __real_dlopen(system_curl().c_str(), RTLD_NOW | RTLD_LOCAL);
    const auto version = reinterpret_cast<char* (*)()>(::dlsym(library, "curl_version"));
    const Words words = {"Found curl_version function", std::string("Curl version = ") + version()};
    __real_dlclose(library);
    return words;
}

Words sending(const std::string& uri)
{
    return {"Sending the URI " + uri + " to the Curl library"};
}

/// Of a transfer that gets as far as to its request.
Words attempt_words(const std::string& uri, const Words& outcome = {})
{
    return joined({download_begin, search, file_words, version_words(), begin_words, sending(uri), options_words,
                   outcome, end_words});
}

class Download : public Transfer {
protected:
    std::string fetch(const std::string& uri)
    {
        slot = 0;
        fetched = false;
        return NVR_MethodWrapper::downloadFileUsingCurl(String(uri.data(), uri.size()), slot, fetched);
    }

    uint32 slot = 0;
    bool fetched = false;
};

} // namespace

TEST_F(Download, APathThatIsThereNeedsNoLibrary)
{
    install_curl();
    write_file(folder + "/image", "x");
    for (const std::string& path : {folder + "/image", std::string("image"), std::string("./image"), folder}) {
        EXPECT_EQ(fetch(path), path);
        EXPECT_FALSE(fetched);
        EXPECT_EQ(slot, 0u);
    }
    EXPECT_THAT(opened, IsEmpty());
    EXPECT_EQ(words(), Words(4, download_begin[0]));
    EXPECT_EQ(read_file("image"), "x");
}

TEST_F(Download, WithoutTheLibraryTheUriComesBack)
{
    const std::string uri = "ftp://127.0.0.1/folder/image";
    EXPECT_EQ(fetch(uri), uri);
    EXPECT_FALSE(fetched);
    EXPECT_EQ(slot, 0u);
    EXPECT_THAT(opened, ElementsAre(std::pair("/lib/libcurl.so.4", 258), std::pair("/usr/lib/libcurl.so.4", 258),
                                    std::pair("libcurl.so", 258), std::pair("curl.dll", 258)));
    EXPECT_EQ(words(), joined({download_begin,
                               search,
                               last_place,
                               {"ERROR: Could not load the curl library to download from internet"}}));
    EXPECT_THAT(names_in(folder), IsEmpty());
}

TEST_F(Download, TheFirstPlaceThatHasTheLibraryIsTaken)
{
    const Words places = joined({search, last_place});
    const std::array<const char*, 4> paths = {"/lib/libcurl.so.4", "/usr/lib/libcurl.so.4", "libcurl.so", "curl.dll"};
    for (std::size_t first = paths.size(); first-- > 0;) {
        led_to[paths[first]] = system_curl();
        opened.clear();
        const std::size_t said = words().size();
        fetch("file:///none/image");
        ASSERT_EQ(opened.size(), first + 1);
        EXPECT_EQ(opened.back().first, paths[first]);
        const Words all = words();
        EXPECT_EQ(Words(all.begin() + static_cast<long>(said) + 2, all.begin() + static_cast<long>(said + 3 + first)),
                  Words(places.begin(), places.begin() + static_cast<long>(first) + 1));
    }
    led_to.clear();
}

TEST_F(Download, ANameWithoutAFolderIsNoUri)
{
    install_curl();
    EXPECT_EQ(fetch("image"), "image");
    EXPECT_FALSE(fetched);
    EXPECT_EQ(slot, 0u);
    EXPECT_EQ(words(),
              joined({download_begin, search, {"ERROR: Could not parse the URI to get the firmware file name"}}));
    EXPECT_THAT(names_in(folder), IsEmpty());
}

TEST_F(Download, AFolderHasNoFileName)
{
    install_curl();
    EXPECT_EQ(fetch("http://127.0.0.1/folder/"), "");
    EXPECT_FALSE(fetched);
    EXPECT_EQ(slot, 0u);
    EXPECT_EQ(words(), joined({download_begin, search, {"ERROR: Could not open the file for writing"}}));
    EXPECT_THAT(names_in(folder), IsEmpty());
}

TEST_F(Download, WritesToNothingButAFile)
{
    install_curl();
    make_folder(folder + "/folder");
    ASSERT_EQ(::mkfifo((folder + "/fifo").c_str(), 0600), 0);
    link("/dev/null", folder + "/device");
    link("/var/log/elsewhere", folder + "/dangling");
    const Words before = names_in(folder);
    for (const std::string& name :
         {std::string(".."), std::string("."), std::string("folder"), std::string("fifo"), std::string("device"),
          std::string("dangling"), std::string(300, 'x'), std::string(65536, 'y')}) {
        EXPECT_EQ(fetch("http://127.0.0.1/" + name), name);
        EXPECT_FALSE(fetched);
        EXPECT_EQ(words().back(), "ERROR: Could not open the file for writing");
    }
    EXPECT_EQ(names_in(folder), before);
    EXPECT_FALSE(exists("/var/log/elsewhere"));
}

TEST_F(Download, FetchesByHttp)
{
    use_stand_in();
    write_file(served + "/image", std::string(100000, 'i'));
    write_file(folder + "/image", std::string(200000, 'o'));
    File_Server server("http", served);
    const std::string uri = server.url() + "image";
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_TRUE(fetched);
    EXPECT_EQ(slot, 0u);
    EXPECT_EQ(read_file("image"), std::string(100000, 'i'));
    EXPECT_EQ(words(), attempt_words(uri));
    EXPECT_EQ(server.next_request(), "GET /image -");

    EXPECT_EQ(stand_in->features, 3);
    ASSERT_EQ(stand_in->options_set, 6);
    const int numbers[] = {10002, 20011, 10001, 10010, 64, 81};
    const long long values[] = {1, 1, 1, 1, 0, 0};
    for (int i = 0; i < 6; i++) {
        EXPECT_EQ(stand_in->options[i].number, numbers[i]);
        EXPECT_EQ(stand_in->options[i].value, values[i]);
    }
    EXPECT_EQ(stand_in->options[0].text, uri);
}

TEST_F(Download, FetchesWhateverTheLibraryCan)
{
    install_curl();
    write_file(served + "/image", "the image");
    EXPECT_EQ(fetch("file://" + served + "/image"), "image");
    EXPECT_EQ(read_file("image"), "the image");
    for (const char* kind : {"https", "ftp"}) {
        remove(folder + "/image");
        File_Server server(kind, served);
        EXPECT_EQ(fetch(server.url() + "image"), "image") << kind;
        EXPECT_TRUE(fetched);
        EXPECT_EQ(read_file("image"), "the image") << kind;
    }
}

TEST_F(Download, TheNameIsTheUrisLastPartLetterForLetter)
{
    install_curl();
    write_file(served + "/a b", "the image");
    File_Server server("http", served);
    for (const std::string name : {"a%20b", "a%20b?q=1", "a%20b#here"}) {
        EXPECT_EQ(fetch(server.url() + name), name);
        EXPECT_EQ(read_file(name), "the image") << name;
    }
    EXPECT_EQ(fetch(server.url() + "..%2f..%2fetc%2fpasswd"), "..%2f..%2fetc%2fpasswd");
    EXPECT_EQ(fetch(server.url() + "it's-\"%s%n\""), "it's-\"%s%n\"");
    EXPECT_EQ(names_in(folder).size(), 5u);
}

TEST_F(Download, AUriEndsAtAZeroByte)
{
    install_curl();
    write_file(served + "/image", "the image");
    File_Server server("http", served);
    std::string uri = server.url() + "image";
    uri += '\0';
    uri += "/behind";
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_EQ(read_file("image"), "the image");
    EXPECT_THAT(names_in(folder), ElementsAre("image"));
}

TEST_F(Download, AServersRefusalIsAFileToo)
{
    install_curl();
    File_Server server("http", served);
    const std::string uri = server.url() + "nothing";
    EXPECT_EQ(fetch(uri), "nothing");
    EXPECT_TRUE(fetched);
    EXPECT_EQ(words(), attempt_words(uri));
    EXPECT_THAT(read_file("nothing"), HasSubstr("404"));
}

TEST_F(Download, AUriOf64KilobytesIsLeftToTheServer)
{
    install_curl();
    File_Server server("http", served);
    const std::string uri = server.url() + std::string(65536, 'f') + "/image";
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_TRUE(fetched);
    EXPECT_THAT(read_file("image"), HasSubstr("414"));
}

TEST_F(Download, WhatBreaksOffLeavesWhatCame)
{
    install_curl();
    File_Server server("http", served);
    const std::string uri = server.url() + "broken/image";
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_TRUE(fetched);
    EXPECT_EQ(slot, 0u);
    EXPECT_EQ(words(), attempt_words(uri, {"download failed 18"}));
    EXPECT_EQ(read_file("image"), std::string(500, 'x'));
}

TEST_F(Download, WithoutAServerTheFileIsEmpty)
{
    install_curl();
    const std::string uri = deserted_url() + "image";
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_TRUE(fetched);
    EXPECT_EQ(slot, 0u);
    EXPECT_EQ(words(), attempt_words(uri, {"download failed 7"}));
    EXPECT_EQ(read_file("image"), "");
}

TEST_F(Download, AMalformedUriComesBackAndItsFileStays)
{
    install_curl();
    for (const std::string uri : {"http://127.0.0.1:99999999/image", "http://127.0.0.1/ima\nge"}) {
        const std::size_t said = words().size();
        EXPECT_EQ(fetch(uri), uri);
        EXPECT_TRUE(fetched);
        EXPECT_EQ(slot, 0u);
        const Words all = words();
        EXPECT_EQ(Words(all.begin() + static_cast<long>(said), all.end()), attempt_words(uri, {"download failed 3"}));
        EXPECT_EQ(read_file(uri.substr(uri.rfind('/') + 1)), "");
    }
}

TEST_F(Download, AnUnknownSchemeIsALibrarysFailure)
{
    install_curl();
    const std::string uri = "carrier://pigeon/image";
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_TRUE(fetched);
    EXPECT_EQ(words(), attempt_words(uri, {"download failed 1"}));
}

TEST_F(Download, AFullDiskEndsTheTransfer)
{
    install_curl();
    write_file(served + "/image", std::string(200000, 'i'));
    ASSERT_EQ(::mount("tmpfs", folder.c_str(), "tmpfs", 0, "size=64k"), 0);
    ASSERT_EQ(::chdir(folder.c_str()), 0);
    const std::string uri = "file://" + served + "/image";
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_TRUE(fetched);
    EXPECT_EQ(words(), attempt_words(uri, {"download failed 23"}));
    EXPECT_LT(read_file("image").size(), 200000u);
}

TEST_F(Download, WithoutAVersionItIsNotTold)
{
    use_stand_in("curl_version");
    write_file(served + "/image", "the image");
    const std::string uri = "file://" + served + "/image";
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_EQ(read_file("image"), "the image");
    EXPECT_EQ(slot, 0u);
    EXPECT_EQ(words(),
              joined({download_begin, search, file_words, begin_words, sending(uri), options_words, end_words}));
}

TEST_F(Download, WithoutGlobalInitNothingIsFetched)
{
    use_stand_in("curl_global_init");
    EXPECT_EQ(fetch("file:///none/image"), "image");
    EXPECT_FALSE(fetched);
    EXPECT_EQ(slot, 4u);
    EXPECT_EQ(words(), joined({download_begin,
                               search,
                               file_words,
                               version_words(),
                               {"unable to locate function curl_global_init in curl so",
                                "unable to locate function curl_easy_init in curl so"}}));
    EXPECT_EQ(read_file("image"), "") << "the file is left behind";
    EXPECT_EQ(stand_in->handles, 0);
}

TEST_F(Download, WithoutEasyInitNothingIsFetched)
{
    use_stand_in("curl_easy_init");
    EXPECT_EQ(fetch("file:///none/image"), "image");
    EXPECT_FALSE(fetched);
    EXPECT_EQ(slot, 4u);
    const Words all = words();
    ASSERT_GE(all.size(), 2u);
    EXPECT_THAT(all[all.size() - 2], StartsWith("A dynamic linking error occurred:("));
    EXPECT_THAT(all[all.size() - 2], HasSubstr("curl_easy_init)"));
    EXPECT_EQ(all,
              joined({download_begin,
                      search,
                      file_words,
                      version_words(),
                      {begin_words[0], all[all.size() - 2], "unable to locate function curl_easy_init in curl so"}}));
    EXPECT_EQ(read_file("image"), "");
}

TEST_F(Download, WithoutSetoptNothingIsFetched)
{
    use_stand_in("curl_easy_setopt");
    EXPECT_EQ(fetch("file:///none/image"), "image");
    EXPECT_FALSE(fetched);
    EXPECT_EQ(slot, 4u);
    EXPECT_EQ(words(), joined({download_begin,
                               search,
                               file_words,
                               version_words(),
                               begin_words,
                               {"unable to locate function curl_easy_setopt in curl so"}}));
    EXPECT_EQ(read_file("image"), "");
}

TEST_F(Download, WithoutPerformAnEmptyFileIsTakenForFetched)
{
    use_stand_in("curl_easy_perform");
    const std::string uri = "file:///none/image";
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_TRUE(fetched);
    EXPECT_EQ(slot, 4u);
    EXPECT_EQ(words(), attempt_words(uri));
    EXPECT_EQ(read_file("image"), "");
}

TEST_F(Download, WithoutCleanupTheFileIsFetchedAllTheSame)
{
    use_stand_in("curl_easy_cleanup");
    unended_handles = 1;
    write_file(served + "/image", "the image");
    const std::string uri = "file://" + served + "/image";
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_TRUE(fetched);
    EXPECT_EQ(slot, 4u);
    EXPECT_EQ(read_file("image"), "the image");
    const Words all = words();
    ASSERT_GE(all.size(), 3u);
    const std::string linking = all[all.size() - 3];
    EXPECT_THAT(linking, StartsWith("A dynamic linking error occurred:("));
    EXPECT_THAT(linking, HasSubstr("curl_easy_cleanup)"));
    EXPECT_EQ(all, joined({download_begin,
                           search,
                           file_words,
                           version_words(),
                           begin_words,
                           sending(uri),
                           options_words,
                           {linking, "unable to locate function curl_easy_cleanup in curl so",
                            "Successfully closed curl so"}}));
}

TEST_F(Download, WithoutGlobalCleanupTheFileIsFetchedAllTheSame)
{
    use_stand_in("curl_global_cleanup");
    uncleaned_globals = 1;
    write_file(served + "/image", "the image");
    const std::string uri = "file://" + served + "/image";
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_TRUE(fetched);
    EXPECT_EQ(slot, 0u);
    EXPECT_EQ(read_file("image"), "the image");
    EXPECT_EQ(words(), joined({download_begin,
                               search,
                               file_words,
                               version_words(),
                               begin_words,
                               sending(uri),
                               options_words,
                               {end_words[0], "could not locate curl_global_cleanup in libcurl", end_words[1]}}));
}

TEST_F(Download, AFailedInitialisationIsToldAndTheTransferGoesOn)
{
    use_stand_in();
    stand_in->global_init_code = 2;
    write_file(served + "/image", "the image");
    const std::string uri = "file://" + served + "/image";
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_TRUE(fetched);
    EXPECT_EQ(slot, 4u);
    EXPECT_EQ(read_file("image"), "the image");
    EXPECT_EQ(words(), joined({download_begin,
                               search,
                               file_words,
                               version_words(),
                               {begin_words[0], "unable to initalize curl", begin_words[1]},
                               sending(uri),
                               options_words,
                               end_words}));
}

TEST_F(Download, ARefusedHandleEndsTheTransfer)
{
    use_stand_in();
    stand_in->refuses_handle = true;
    EXPECT_EQ(fetch("file:///none/image"), "image");
    EXPECT_FALSE(fetched);
    EXPECT_EQ(slot, 0u);
    EXPECT_EQ(words(), joined({download_begin,
                               search,
                               file_words,
                               version_words(),
                               {begin_words[0], "ERROR: Could not initialise the curl"}}));
    EXPECT_EQ(read_file("image"), "");
}

TEST_F(Download, ARefusedOptionEndsTheTransfer)
{
    use_stand_in();
    const std::string uri = "file:///none/image";
    const Words code_line = {"CURL Error Code: 42 "};
    const auto first_options = [](long count) { return Words(options_words.begin(), options_words.begin() + count); };
    const struct {
        int option;
        Words words;
    } rows[] = {
        {10002, joined({code_line, {"Error Sending the URI to the Curl library 42"}})},
        {20011, joined({first_options(2), {"Error Sending the CURLOPT_FILE to the Curl library 42"}})},
        {10001, joined({first_options(3), {"Error Sending the CURLOPT_FILE to the Curl library 42"}})},
        {10010,
         joined({first_options(3), code_line, {"Error Sending the CURLOPT_ERRORBUFFER to the Curl library 42"}})},
        {64, joined({first_options(5), {"Error setting CURLOPT_SSL_VERIFYPEER in the Curl library 42"}})},
        {81, joined({first_options(6), {"Error setting CURLOPT_SSL_VERIFYHOST in the Curl library 42"}})},
    };
    for (const auto& row : rows) {
        stand_in->failing_option = row.option;
        stand_in->failing_option_use = 1;
        stand_in->failing_code = 42;
        const std::size_t said = words().size();
        EXPECT_EQ(fetch(uri), "image");
        EXPECT_FALSE(fetched);
        EXPECT_EQ(slot, 4u);
        const Words all = words();
        EXPECT_EQ(Words(all.begin() + static_cast<long>(said), all.end()),
                  joined({download_begin, search, file_words, version_words(), begin_words, sending(uri), row.words}));
        EXPECT_EQ(read_file("image"), "");
    }
    EXPECT_EQ(stand_in->performed, 0);
}

TEST_F(Download, WhatTheLibraryThrowsEndsTheTransfer)
{
    use_stand_in();
    stand_in->throws = true;
    const std::string uri = "file:///none/image";
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_FALSE(fetched);
    EXPECT_EQ(words(), joined({download_begin,
                               search,
                               file_words,
                               version_words(),
                               begin_words,
                               sending(uri),
                               options_words,
                               {"ERROR: error caught in accessing Curl Library"}}));
}

TEST_F(Download, ALibraryThatDoesNotCloseIsTold)
{
    install_curl();
    loader_refuses = true;
    write_file(served + "/image", "the image");
    const std::string uri = "file://" + served + "/image";
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_EQ(words(), joined({attempt_words(uri), {"UNABLE TO CLOSE DYNAMIC LIB"}}));
    loader_refuses = false;
}

// -------------------------------------------------------------------------------------------------------------- upload

namespace {

const Words upload_begin = {"Inside NVR_MethodWrapper::uploadFileUsingCurl"};
const Words not_begun = {"couldnot initialize curl library"};

class Upload : public Transfer {
protected:
    Upload() { write_file(folder + "/file", "the file's content"); }

    static int bring(const std::string& uri, const std::string& path = "file")
    {
        return NVR_MethodWrapper::uploadFileUsingCurl(uri.c_str(), path.c_str());
    }

    /// Of an upload of the file that gets as far as to its first option.
    static Words file_words(const std::string& uri)
    {
        return joined({upload_begin, search, version_words(), {"iFileSize size:: 18", "URI.value.c_str(): " + uri}});
    }
    static Words request_words(const std::string& uri)
    {
        return joined({file_words(uri), {"Successfully Set CURLOPT_UPLOAD = 0"}});
    }
};

} // namespace

TEST_F(Upload, AFileThatIsNotThereIsNotSought)
{
    install_curl();
    EXPECT_EQ(bring("http://127.0.0.1/file", "nothing"), -1);
    EXPECT_THAT(opened, IsEmpty());
    EXPECT_EQ(words(), joined({upload_begin, {"couldnot locate the file nothing, to be uploaded"}}));
}

TEST_F(Upload, WithoutTheLibraryItFails)
{
    EXPECT_EQ(bring("http://127.0.0.1/file"), -1);
    EXPECT_EQ(words(),
              joined({upload_begin, search, last_place, {"ERROR: Could not load the curl library "}, not_begun}));
}

TEST_F(Upload, BringsByHttp)
{
    use_stand_in();
    File_Server server("http", served);
    const std::string uri = server.url() + "brought";
    EXPECT_EQ(bring(uri), 0);
    EXPECT_EQ(read_file(served + "/brought"), "the file's content");
    EXPECT_EQ(words(), request_words(uri));
    EXPECT_EQ(server.next_request(), "PUT /brought Basic Og==") << "no user and no password";

    ASSERT_EQ(stand_in->options_set, 12);
    const int numbers[] = {46, 54, 10002, 10009, 10009, 13, 14, 30115, 64, 81, 10005, 107};
    const long long values[] = {1, 1, 1, 1, 1, 100, 18, 18, 0, 0, 1, 1};
    for (int i = 0; i < 12; i++) {
        EXPECT_EQ(stand_in->options[i].number, numbers[i]);
        EXPECT_EQ(stand_in->options[i].value, values[i]);
    }
    EXPECT_EQ(stand_in->options[2].text, uri);
    EXPECT_STREQ(stand_in->options[10].text, ":");
}

TEST_F(Upload, BringsByHttpsWithoutTrust)
{
    install_curl();
    File_Server server("https", served);
    EXPECT_EQ(bring(server.url() + "brought"), 0);
    EXPECT_EQ(read_file(served + "/brought"), "the file's content");
}

TEST_F(Upload, BringsAnEmptyFile)
{
    install_curl();
    write_file(folder + "/empty", "");
    EXPECT_EQ(bring("file://" + served + "/brought", "empty"), 0);
    EXPECT_EQ(read_file(served + "/brought"), "");
}

TEST_F(Upload, SendsNothingButFiles)
{
    use_stand_in();
    ASSERT_EQ(::mkfifo((folder + "/fifo").c_str(), 0600), 0);
    link("/dev/zero", folder + "/device");
    for (const char* path : {"fifo", "device", "/var/log"}) {
        const std::size_t said = words().size();
        EXPECT_EQ(bring("http://127.0.0.1/file", path), 1) << path;
        const Words all = words();
        EXPECT_EQ(Words(all.begin() + static_cast<long>(said), all.end()),
                  joined({upload_begin, search, version_words()}));
    }
    EXPECT_EQ(stand_in->handles, 3);
}

TEST_F(Upload, WithoutAServerItFails)
{
    install_curl();
    const std::string uri = deserted_url() + "file";
    EXPECT_EQ(bring(uri), -1);
    EXPECT_EQ(words(), joined({request_words(uri), {"curl upload file failed, errorcode 7"}}));
}

TEST_F(Upload, WithoutAVersionItIsNotTold)
{
    use_stand_in("curl_version");
    const std::string uri = "file://" + served + "/brought";
    EXPECT_EQ(bring(uri), 0);
    EXPECT_EQ(words(),
              joined({upload_begin,
                      search,
                      {"iFileSize size:: 18", "URI.value.c_str(): " + uri, "Successfully Set CURLOPT_UPLOAD = 0"}}));
}

TEST_F(Upload, WithoutGlobalInitItFails)
{
    use_stand_in("curl_global_init");
    EXPECT_EQ(bring("file:///none"), -1);
    EXPECT_EQ(words(), joined({upload_begin,
                               search,
                               version_words(),
                               {"unable to locate function curl_global_init in curl so"},
                               not_begun}));
}

TEST_F(Upload, WithoutEasyInitItFails)
{
    use_stand_in("curl_easy_init");
    EXPECT_EQ(bring("file:///none"), -1);
    EXPECT_EQ(words(), joined({upload_begin,
                               search,
                               version_words(),
                               {"unable to locate function curl_easy_init in curl so"},
                               not_begun}));
}

TEST_F(Upload, AFailedInitialisationOrARefusedHandleEndsIt)
{
    use_stand_in();
    stand_in->global_init_code = 2;
    EXPECT_EQ(bring("file:///none"), -1);
    EXPECT_EQ(words(), joined({upload_begin, search, version_words(), {"unable to initalize curl"}, not_begun}));
    stand_in->global_init_code = 0;
    stand_in->refuses_handle = true;
    uncleaned_globals = 1; // what failed needs no cleaning up
    EXPECT_EQ(bring("file:///none"), -1);
    EXPECT_EQ(words().end()[-2], "ERROR: Could not initialise the curl");
    EXPECT_EQ(words().end()[-1], not_begun[0]);
}

TEST_F(Upload, WithoutSetoptItFails)
{
    use_stand_in("curl_easy_setopt");
    EXPECT_EQ(bring("file:///none"), -1);
    const Words all = words();
    EXPECT_THAT(all.back(), StartsWith("A dynamic linking error occurred:("));
    EXPECT_THAT(all.back(), HasSubstr("curl_easy_setopt)"));
    EXPECT_EQ(all, joined({upload_begin,
                           search,
                           version_words(),
                           {"unable to locate function curl_easy_setopt in curl so", all.back()}}));
}

TEST_F(Upload, WithoutPerformItFails)
{
    use_stand_in("curl_easy_perform");
    const std::string uri = "file:///none";
    EXPECT_EQ(bring(uri), -1);
    const Words all = words();
    EXPECT_THAT(all.back(), HasSubstr("curl_easy_perform)"));
    EXPECT_EQ(all, joined({request_words(uri), {"dlsym, couldnot locate the symbol curl_easy_perform", all.back()}}));
}

TEST_F(Upload, WithoutCleanupsTheFileIsBroughtAllTheSame)
{
    const std::string uri = "file://" + served + "/brought";
    use_stand_in("curl_easy_cleanup");
    unended_handles = 1;
    EXPECT_EQ(bring(uri), 0);
    Words all = words();
    EXPECT_THAT(all.back(), HasSubstr("curl_easy_cleanup)"));
    EXPECT_EQ(all,
              joined({request_words(uri), {"unable to locate function curl_easy_cleanup in curl so", all.back()}}));
    EXPECT_EQ(stand_in->handles_ended, 0);
    EXPECT_EQ(stand_in->global_cleanups, 1);
}

TEST_F(Upload, WithoutAGlobalCleanupTheFileIsBroughtAllTheSame)
{
    const std::string uri = "file://" + served + "/brought";
    use_stand_in("curl_global_cleanup");
    uncleaned_globals = 1;
    EXPECT_EQ(bring(uri), 0);
    const Words all = words();
    EXPECT_THAT(all.back(), HasSubstr("curl_global_cleanup)"));
    EXPECT_EQ(all, joined({request_words(uri), {"could not locate curl_global_cleanup in libcurl", all.back()}}));
}

TEST_F(Upload, ARefusedOptionEndsIt)
{
    use_stand_in();
    const std::string uri = "file:///none";
    const struct {
        int option, use;
        const char* failure;
    } rows[] = {
        {46, 1, "Error Setting CURLOPT_UPLOAD, errorcode = 42"},
        {54, 1, "Error setting the CURLOPT_PUT,error code 42"},
        {10002, 1, "Error setting the CURLOPT_URL,error code 42"},
        {10009, 1, "Error Setting CURLOPT_READDATA, errorcode = 42"},
        {10009, 2, "Error Setting CURLOPT_INFILE, errorcode = 42"},
        {13, 1, "Error Setting CURLOPT_TIMEOUT, errorcode = 42"},
        {14, 1, "Error Setting CURLOPT_INFILESIZE, errorcode = 42"},
        {30115, 1, "Error Setting CURLOPT_INFILESIZE_LARGE, errorcode = 42"},
        {64, 1, "Error setting CURLOPT_SSL_VERIFYPEER in the Curl library, errorcode 42"},
        {81, 1, "Error setting CURLOPT_SSL_VERIFYHOST in the Curl library 42"},
        {10005, 1, "Error setting CURLOPT_USERPWD in the Curl library 42"},
        {107, 1, "Error setting CURLOPT_USERPWD in the Curl library 42"},
    };
    for (const auto& row : rows) {
        stand_in->failing_option = row.option;
        stand_in->failing_option_use = row.use;
        stand_in->failing_code = 42;
        const std::size_t said = words().size();
        EXPECT_EQ(bring(uri), -1);
        const Words all = words();
        EXPECT_EQ(Words(all.begin() + static_cast<long>(said), all.end()),
                  joined({row.option == 46 ? file_words(uri) : request_words(uri), {row.failure}}));
    }
    EXPECT_EQ(stand_in->performed, 0);
}

// What ends the transfer before its end is cleaned up in silence, whatever else the library lacks.
TEST_F(Upload, ARefusedOptionIsTheOnlyFailureToldThoughCleanupIsMissingToo)
{
    use_stand_in("curl_easy_cleanup");
    unended_handles = 1;
    stand_in->failing_option = 14;
    stand_in->failing_code = 42;
    EXPECT_EQ(bring("file:///none"), -1);
    EXPECT_EQ(words(), joined({request_words("file:///none"), {"Error Setting CURLOPT_INFILESIZE, errorcode = 42"}}));
    EXPECT_EQ(stand_in->global_cleanups, 1);
}

TEST_F(Upload, ARefusedOptionIsTheOnlyFailureToldThoughTheGlobalCleanupIsMissingToo)
{
    use_stand_in("curl_global_cleanup");
    uncleaned_globals = 1;
    stand_in->failing_option = 46;
    stand_in->failing_code = 42;
    EXPECT_EQ(bring("file:///none"), -1);
    EXPECT_EQ(words(), joined({file_words("file:///none"), {"Error Setting CURLOPT_UPLOAD, errorcode = 42"}}));
    EXPECT_EQ(stand_in->handles_ended, 1);
}

TEST_F(Upload, ALibraryThatDoesNotCloseIsTold)
{
    install_curl();
    loader_refuses = true;
    const std::string uri = "file://" + served + "/brought";
    EXPECT_EQ(bring(uri), 0);
    EXPECT_EQ(words(), joined({request_words(uri), {"UNABLE TO CLOSE DYNAMIC LIB"}}));
    loader_refuses = false;
}
