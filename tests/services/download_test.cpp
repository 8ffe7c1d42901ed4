// Files fetched by libcurl: whatever the host has, whatever the address.
#include <array>
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

#include "tests/services/Transfer.h"

using namespace cimple;
using namespace nvrtest;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

namespace {

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

    /// A transfer of `uri` by a stand-in that lacks an entry or fails: it is told in these words behind the version,
    /// and ends with the file "image", of that content, and these results.
    void expect_told(const std::string& uri, bool is_fetched, uint32 slot_left, const Words& told,
                     const std::string& content = "")
    {
        EXPECT_EQ(fetch(uri), "image");
        EXPECT_EQ(fetched, is_fetched);
        EXPECT_EQ(slot, slot_left);
        EXPECT_EQ(words(), joined({download_begin, search, file_words, version_words(), told}));
        EXPECT_EQ(read_file("image"), content);
    }
    /// A file that can be fetched; its URI.
    std::string serve(const std::string& content = "the image")
    {
        write_file(served + "/image", content);
        return "file://" + served + "/image";
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
        words();
        fetch("file:///none/image");
        ASSERT_EQ(opened.size(), first + 1);
        EXPECT_EQ(opened.back().first, paths[first]);
        const Words all = words();
        EXPECT_EQ(Words(all.begin() + 2, all.begin() + static_cast<long>(3 + first)),
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
    make_link("/dev/null", folder + "/device");
    make_link("/var/log/elsewhere", folder + "/dangling");
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
        EXPECT_EQ(fetch(uri), uri);
        EXPECT_TRUE(fetched);
        EXPECT_EQ(slot, 0u);
        EXPECT_EQ(words(), attempt_words(uri, {"download failed 3"}));
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
    const std::string uri = serve(std::string(200000, 'i'));
    ASSERT_EQ(::mount("tmpfs", folder.c_str(), "tmpfs", 0, "size=64k"), 0);
    ASSERT_EQ(::chdir(folder.c_str()), 0);
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_TRUE(fetched);
    EXPECT_EQ(words(), attempt_words(uri, {"download failed 23"}));
    EXPECT_LT(read_file("image").size(), 200000u);
}

TEST_F(Download, WithoutAVersionItIsNotTold)
{
    use_stand_in("curl_version");
    const std::string uri = serve();
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_EQ(read_file("image"), "the image");
    EXPECT_EQ(slot, 0u);
    EXPECT_EQ(words(),
              joined({download_begin, search, file_words, begin_words, sending(uri), options_words, end_words}));
}

TEST_F(Download, WithoutGlobalInitNothingIsFetched)
{
    use_stand_in("curl_global_init");
    expect_told("file:///none/image", false, 4,
                {"unable to locate function curl_global_init in curl so",
                 "unable to locate function curl_easy_init in curl so"});
    EXPECT_EQ(stand_in->handles, 0);
}

TEST_F(Download, WithoutEasyInitNothingIsFetched)
{
    use_stand_in("curl_easy_init");
    EXPECT_EQ(fetch("file:///none/image"), "image");
    EXPECT_FALSE(fetched);
    EXPECT_EQ(slot, 4u);
    const Words all = words();
    EXPECT_EQ(all, joined({download_begin,
                           search,
                           file_words,
                           version_words(),
                           {begin_words[0], linking_error(all, "curl_easy_init"),
                            "unable to locate function curl_easy_init in curl so"}}));
    EXPECT_EQ(read_file("image"), "");
}

TEST_F(Download, WithoutSetoptNothingIsFetched)
{
    use_stand_in("curl_easy_setopt");
    expect_told("file:///none/image", false, 4,
                joined({begin_words, {"unable to locate function curl_easy_setopt in curl so"}}));
}

TEST_F(Download, WithoutPerformAnEmptyFileIsTakenForFetched)
{
    use_stand_in("curl_easy_perform");
    const std::string uri = "file:///none/image";
    expect_told(uri, true, 4, joined({begin_words, sending(uri), options_words, end_words}));
}

TEST_F(Download, WithoutCleanupTheFileIsFetchedAllTheSame)
{
    use_stand_in("curl_easy_cleanup");
    unended_handles = 1;
    const std::string uri = serve();
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_TRUE(fetched);
    EXPECT_EQ(slot, 4u);
    EXPECT_EQ(read_file("image"), "the image");
    const Words all = words();
    EXPECT_EQ(all, joined({download_begin,
                           search,
                           file_words,
                           version_words(),
                           begin_words,
                           sending(uri),
                           options_words,
                           {linking_error(all, "curl_easy_cleanup"),
                            "unable to locate function curl_easy_cleanup in curl so", "Successfully closed curl so"}}));
}

TEST_F(Download, WithoutGlobalCleanupTheFileIsFetchedAllTheSame)
{
    use_stand_in("curl_global_cleanup");
    uncleaned_globals = 1;
    const std::string uri = serve();
    expect_told(uri, true, 0,
                joined({begin_words,
                        sending(uri),
                        options_words,
                        {end_words[0], "could not locate curl_global_cleanup in libcurl", end_words[1]}}),
                "the image");
}

TEST_F(Download, AFailedInitialisationIsToldAndTheTransferGoesOn)
{
    use_stand_in();
    stand_in->global_init_code = 2;
    const std::string uri = serve();
    expect_told(
        uri, true, 4,
        joined({{begin_words[0], "unable to initalize curl", begin_words[1]}, sending(uri), options_words, end_words}),
        "the image");
}

TEST_F(Download, ARefusedHandleEndsTheTransfer)
{
    use_stand_in();
    stand_in->refuses_handle = true;
    expect_told("file:///none/image", false, 0, {begin_words[0], "ERROR: Could not initialise the curl"});
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
        refuse_option(row.option);
        expect_told(uri, false, 4, joined({begin_words, sending(uri), row.words}));
    }
    EXPECT_EQ(stand_in->performed, 0);
}

TEST_F(Download, WhatTheLibraryThrowsEndsTheTransfer)
{
    use_stand_in();
    stand_in->throws = true;
    const std::string uri = "file:///none/image";
    expect_told(uri, false, 0,
                joined({begin_words, sending(uri), options_words, {"ERROR: error caught in accessing Curl Library"}}));
}

TEST_F(Download, ALibraryThatDoesNotCloseIsTold)
{
    install_curl();
    loader_refuses = true;
    const std::string uri = serve();
    EXPECT_EQ(fetch(uri), "image");
    EXPECT_EQ(words(), joined({attempt_words(uri), {"UNABLE TO CLOSE DYNAMIC LIB"}}));
    loader_refuses = false;
}
