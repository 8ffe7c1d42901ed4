// Files brought to an address by libcurl.
#include <sys/stat.h>

#include "tests/services/Transfer.h"

using namespace cimple;
using namespace nvrtest;
using testing::IsEmpty;

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

    /// It ends so, and is told in these words behind its beginning.
    void expect_told(const std::string& uri, int result, const Words& told, const std::string& path = "file")
    {
        EXPECT_EQ(bring(uri, path), result);
        EXPECT_EQ(words(), joined({upload_begin, told}));
    }

    /// Of an upload of the file that gets as far as to its first option.
    static Words file_words(const std::string& uri)
    {
        return joined({search, version_words(), {"iFileSize size:: 18", "URI.value.c_str(): " + uri}});
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
    expect_told("http://127.0.0.1/file", -1, {"couldnot locate the file nothing, to be uploaded"}, "nothing");
    EXPECT_THAT(opened, IsEmpty());
}

TEST_F(Upload, WithoutTheLibraryItFails)
{
    expect_told("http://127.0.0.1/file", -1,
                joined({search, last_place, {"ERROR: Could not load the curl library "}, not_begun}));
}

TEST_F(Upload, BringsByHttp)
{
    use_stand_in();
    File_Server server("http", served);
    const std::string uri = server.url() + "brought";
    expect_told(uri, 0, request_words(uri));
    EXPECT_EQ(read_file(served + "/brought"), "the file's content");
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
    make_link("/dev/zero", folder + "/device");
    for (const char* path : {"fifo", "device", "/var/log"})
        expect_told("http://127.0.0.1/file", 1, joined({search, version_words()}), path);
    EXPECT_EQ(stand_in->handles, 3);
}

TEST_F(Upload, WithoutAServerItFails)
{
    install_curl();
    const std::string uri = deserted_url() + "file";
    expect_told(uri, -1, joined({request_words(uri), {"curl upload file failed, errorcode 7"}}));
}

TEST_F(Upload, WithoutAVersionItIsNotTold)
{
    use_stand_in("curl_version");
    const std::string uri = "file://" + served + "/brought";
    expect_told(
        uri, 0,
        joined({search, {"iFileSize size:: 18", "URI.value.c_str(): " + uri, "Successfully Set CURLOPT_UPLOAD = 0"}}));
}

TEST_F(Upload, WithoutGlobalInitItFails)
{
    use_stand_in("curl_global_init");
    expect_told(
        "file:///none", -1,
        joined({search, version_words(), {"unable to locate function curl_global_init in curl so"}, not_begun}));
}

TEST_F(Upload, WithoutEasyInitItFails)
{
    use_stand_in("curl_easy_init");
    expect_told("file:///none", -1,
                joined({search, version_words(), {"unable to locate function curl_easy_init in curl so"}, not_begun}));
}

TEST_F(Upload, AFailedInitialisationOrARefusedHandleEndsIt)
{
    use_stand_in();
    stand_in->global_init_code = 2;
    expect_told("file:///none", -1, joined({search, version_words(), {"unable to initalize curl"}, not_begun}));
    stand_in->global_init_code = 0;
    stand_in->refuses_handle = true;
    uncleaned_globals = 1; // what failed needs no cleaning up
    expect_told("file:///none", -1,
                joined({search, version_words(), {"ERROR: Could not initialise the curl"}, not_begun}));
}

TEST_F(Upload, WithoutSetoptItFails)
{
    use_stand_in("curl_easy_setopt");
    EXPECT_EQ(bring("file:///none"), -1);
    const Words all = words();
    EXPECT_EQ(all, joined({upload_begin,
                           search,
                           version_words(),
                           {"unable to locate function curl_easy_setopt in curl so",
                            linking_error(all, "curl_easy_setopt")}}));
}

namespace {

/// A transfer by a library without that entry, and what is said of that at its end.
struct Lacking {
    const char* entry;
    const char* uri;
    int result;
    const char* words;
};

} // namespace

class UploadLacking : public Upload {
protected:
    void expect_end(const Lacking& lacking)
    {
        use_stand_in(lacking.entry);
        EXPECT_EQ(bring(lacking.uri), lacking.result);
        const Words all = words();
        EXPECT_EQ(
            all,
            joined({upload_begin, request_words(lacking.uri), {lacking.words, linking_error(all, lacking.entry)}}));
    }
    static constexpr char brought[] = "file:///var/log/served/brought";
};

TEST_F(UploadLacking, PerformFails)
{
    expect_end({"curl_easy_perform", "file:///none", -1, "dlsym, couldnot locate the symbol curl_easy_perform"});
}

TEST_F(UploadLacking, CleanupBringsTheFileAllTheSame)
{
    unended_handles = 1;
    expect_end({"curl_easy_cleanup", brought, 0, "unable to locate function curl_easy_cleanup in curl so"});
    EXPECT_EQ(stand_in->handles_ended, 0);
    EXPECT_EQ(stand_in->global_cleanups, 1);
}

TEST_F(UploadLacking, GlobalCleanupBringsTheFileAllTheSame)
{
    uncleaned_globals = 1;
    expect_end({"curl_global_cleanup", brought, 0, "could not locate curl_global_cleanup in libcurl"});
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
        refuse_option(row.option, row.use);
        expect_told(uri, -1, joined({row.option == 46 ? file_words(uri) : request_words(uri), {row.failure}}));
    }
    EXPECT_EQ(stand_in->performed, 0);
}

// What ends the transfer before its end is cleaned up in silence, whatever else the library lacks.
TEST_F(Upload, ARefusedOptionIsTheOnlyFailureToldThoughCleanupIsMissingToo)
{
    use_stand_in("curl_easy_cleanup");
    unended_handles = 1;
    refuse_option(14);
    expect_told("file:///none", -1,
                joined({request_words("file:///none"), {"Error Setting CURLOPT_INFILESIZE, errorcode = 42"}}));
    EXPECT_EQ(stand_in->global_cleanups, 1);
}

TEST_F(Upload, ARefusedOptionIsTheOnlyFailureToldThoughTheGlobalCleanupIsMissingToo)
{
    use_stand_in("curl_global_cleanup");
    uncleaned_globals = 1;
    refuse_option(46);
    expect_told("file:///none", -1,
                joined({file_words("file:///none"), {"Error Setting CURLOPT_UPLOAD, errorcode = 42"}}));
    EXPECT_EQ(stand_in->handles_ended, 1);
}

TEST_F(Upload, ALibraryThatDoesNotCloseIsTold)
{
    install_curl();
    loader_refuses = true;
    const std::string uri = "file://" + served + "/brought";
    expect_told(uri, 0, joined({request_words(uri), {"UNABLE TO CLOSE DYNAMIC LIB"}}));
    loader_refuses = false;
}
