// Files fetched from a URI and brought to one, by whatever libcurl the host has. It decides which schemes work.
#include <cstdio>
#include <cstring>
#include <memory>
#include <new>
#include <sys/stat.h>
#include <utility>

#include "foundation/CLogger.h"
#include "foundation/open_file.h"
#include "runtime/Forced_Unwind.h"
#include "services/Curl_Library.h"
#include "services/NVR_MethodWrapper.h"

namespace cimple {

namespace {

constexpr uint32 transfer_failed = 4;

bool exists(const char* path)
{
    struct stat status;
    return ::stat(path, &status) == 0;
}

/// What libcurl calls with received data. A result other than the size of the data ends the transfer.
std::size_t writeData(const void* data, std::size_t size, std::size_t count, std::FILE* file)
{
    return std::fwrite(data, size, count, file) * size;
}

// ------------------------------------------------------------------------------------------------------------ download

class Download {
public:
    Download(const String& uri, uint32& returnValue, bool& fetched)
        : m_uri(uri), m_returnValue(returnValue), m_fetched(fetched)
    {
    }

    /// `path` follows what happens, so that it is right also if this throws.
    void run(std::string& path);

private:
    bool begin();
    bool setOptions(const char* uri);
    bool isSet(int code, const char* failure);
    void perform(std::string& path);
    void end();

    const String& m_uri;
    uint32& m_returnValue;
    bool& m_fetched;
    // Destroyed last to first: libcurl lets go of file and buffer before they go.
    char m_error[curl_error_size] = {};
    File m_file;
    Curl_Library m_curl;
};

void Download::run(std::string& path)
{
    if (!m_curl.open()) {
        NVR_LOG("ERROR: Could not load the curl library to download from internet");
        return;
    }
    const char* const slash = std::strrchr(m_uri.c_str(), '/');
    if (!slash) {
        NVR_LOG("ERROR: Could not parse the URI to get the firmware file name");
        return;
    }
    path = slash + 1;
    m_file = open_regular_file(path.c_str(), "wb");
    if (!m_file) {
        NVR_LOG("ERROR: Could not open the file for writing");
        return;
    }
    std::setvbuf(m_file.get(), nullptr, _IONBF, 0); // so that a full disk is seen by the write that meets it
    NVR_LOG("OPENED the curl library to download from internet");
    if (!begin()) return;

    const std::size_t size = m_uri.size() + 1;
    const std::unique_ptr<char[]> uri(new (std::nothrow) char[size]);
    if (!uri) return;
    std::memcpy(uri.get(), m_uri.c_str(), size);
    if (!setOptions(uri.get())) {
        m_returnValue = transfer_failed;
        return;
    }
    perform(path);
    m_fetched = true;
    end();
}

bool Download::begin()
{
    m_curl.logVersion();
    if (m_curl.global_init) {
        NVR_LOG("execute function curl_global_init in curl so");
        m_curl.initialised = m_curl.global_init.call(curl_all_features) == curl_ok;
        if (!m_curl.initialised) {
            NVR_LOG("unable to initalize curl");
            m_returnValue = transfer_failed;
        }
    } else {
        NVR_LOG("unable to locate function curl_global_init in curl so");
        m_returnValue = transfer_failed;
    }
    m_curl.easy_init.logError();
    if (!m_curl.global_init || !m_curl.easy_init) {
        NVR_LOG("unable to locate function curl_easy_init in curl so");
        m_returnValue = transfer_failed;
        return false;
    }
    m_curl.handle = m_curl.easy_init.call();
    if (!m_curl.handle) {
        NVR_LOG("ERROR: Could not initialise the curl");
        return false;
    }
    NVR_LOG("initialized the curl library to download from internet");
    if (!m_curl.easy_setopt) {
        NVR_LOG("unable to locate function curl_easy_setopt in curl so");
        m_returnValue = transfer_failed;
        return false;
    }
    return true;
}

bool Download::isSet(int code, const char* failure)
{
    if (code == curl_ok) return true;
    NVR_LOG(failure, code);
    return false;
}

bool Download::setOptions(const char* uri)
{
    static constexpr char file_failure[] = "Error Sending the CURLOPT_FILE to the Curl library %d";
    auto* const set = m_curl.easy_setopt.call;
    NVR_LOG("Sending the URI %s to the Curl library", uri);
    int code = set(m_curl.handle, CURL_URL, uri);
    NVR_LOG("CURL Error Code: %d ", code);
    if (!isSet(code, "Error Sending the URI to the Curl library %d")) return false;
    NVR_LOG("Set CURLOPT_FILE :Successfully sent CURLOPT_FILE to curl Library ");
    if (!isSet(set(m_curl.handle, CURL_WRITEFUNCTION, &writeData), file_failure)) return false;
    NVR_LOG("Set CURLOPT_FILE :Successfully sent CURLOPT_FILE to curl Library ");
    if (!isSet(set(m_curl.handle, CURL_FILE, m_file.get()), file_failure)) return false;
    code = set(m_curl.handle, CURL_ERRORBUFFER, m_error);
    NVR_LOG("CURL Error Code: %d ", code);
    if (!isSet(code, "Error Sending the CURLOPT_ERRORBUFFER to the Curl library %d")) return false;
    NVR_LOG("CURLOPT_SSL_VERIFYPEER return code = %d", 0);
    if (!isSet(set(m_curl.handle, CURL_SSL_VERIFYPEER, 0L),
               "Error setting CURLOPT_SSL_VERIFYPEER in the Curl library %d"))
        return false;
    NVR_LOG("CURLOPT_SSL_VERIFYHOST return code = %d", 0);
    return isSet(set(m_curl.handle, CURL_SSL_VERIFYHOST, 0L),
                 "Error setting CURLOPT_SSL_VERIFYHOST in the Curl library %d");
}

void Download::perform(std::string& path)
{
    if (!m_curl.easy_perform) {
        m_returnValue = transfer_failed;
        return;
    }
    const int code = m_curl.easy_perform.call(m_curl.handle);
    if (code == curl_ok) return;
    NVR_LOG("download failed %d", code);
    if (code == curl_malformed_url) path = m_uri.c_str();
}

void Download::end()
{
    if (m_curl.easy_cleanup.error.empty()) NVR_LOG("Found the function curl_easy_cleanup in curl so");
    m_curl.easy_cleanup.logError();
    if (m_curl.easy_cleanup) {
        m_curl.easy_cleanup.call(std::exchange(m_curl.handle, nullptr));
    } else {
        NVR_LOG("unable to locate function curl_easy_cleanup in curl so");
        m_returnValue = transfer_failed;
    }
    m_curl.initialised = false;
    if (m_curl.global_cleanup)
        m_curl.global_cleanup.call();
    else
        NVR_LOG("could not locate curl_global_cleanup in libcurl");
    const bool closed = m_curl.close();
    NVR_LOG("Successfully closed curl so");
    if (!closed) NVR_LOG("UNABLE TO CLOSE DYNAMIC LIB");
}

// -------------------------------------------------------------------------------------------------------------- upload

/// Opens library and handle.
bool beginUpload(Curl_Library& curl)
{
    if (!curl.open()) {
        NVR_LOG("ERROR: Could not load the curl library ");
        return false;
    }
    curl.logVersion();
    if (!curl.global_init) {
        NVR_LOG("unable to locate function curl_global_init in curl so");
        return false;
    }
    curl.initialised = curl.global_init.call(curl_all_features) == curl_ok;
    if (!curl.initialised) {
        NVR_LOG("unable to initalize curl");
        return false;
    }
    if (!curl.easy_init) {
        NVR_LOG("unable to locate function curl_easy_init in curl so");
        return false;
    }
    curl.handle = curl.easy_init.call();
    if (!curl.handle) {
        NVR_LOG("ERROR: Could not initialise the curl");
        return false;
    }
    return true;
}

bool setUploadOptions(const Curl_Library& curl, const char* uri, std::FILE* file, long size)
{
    static constexpr char credentials_failure[] = "Error setting CURLOPT_USERPWD in the Curl library %d";
    const auto set = [&](Curl_Option option, auto value, const char* failure) {
        const int code = curl.easy_setopt.call(curl.handle, option, value);
        if (code != curl_ok) NVR_LOG(failure, code);
        return code == curl_ok;
    };
    if (!set(CURL_UPLOAD, 1L, "Error Setting CURLOPT_UPLOAD, errorcode = %d")) return false;
    NVR_LOG("Successfully Set CURLOPT_UPLOAD = %d", curl_ok);
    // Nobody sets a user or a password.
    return set(CURL_PUT, 1L, "Error setting the CURLOPT_PUT,error code %d") &&
           set(CURL_URL, uri, "Error setting the CURLOPT_URL,error code %d") &&
           set(CURL_READDATA, file, "Error Setting CURLOPT_READDATA, errorcode = %d") &&
           set(CURL_READDATA, file, "Error Setting CURLOPT_INFILE, errorcode = %d") &&
           set(CURL_TIMEOUT, 100L, "Error Setting CURLOPT_TIMEOUT, errorcode = %d") &&
           set(CURL_INFILESIZE, size, "Error Setting CURLOPT_INFILESIZE, errorcode = %d") &&
           set(CURL_INFILESIZE_LARGE, static_cast<long long>(size),
               "Error Setting CURLOPT_INFILESIZE_LARGE, errorcode = %d") &&
           set(CURL_SSL_VERIFYPEER, 0L, "Error setting CURLOPT_SSL_VERIFYPEER in the Curl library, errorcode %d") &&
           set(CURL_SSL_VERIFYHOST, 0L, "Error setting CURLOPT_SSL_VERIFYHOST in the Curl library %d") &&
           set(CURL_USERPWD, ":", credentials_failure) && set(CURL_HTTPAUTH, 1L, credentials_failure);
}

/// Finds the file's size, and leaves it at its start.
long sizeOf(std::FILE* file)
{
    std::fseek(file, 0, SEEK_END);
    const long size = std::ftell(file);
    std::rewind(file);
    return size;
}

bool performUpload(const Curl_Library& curl)
{
    if (!curl.easy_perform) {
        NVR_LOG("dlsym, couldnot locate the symbol curl_easy_perform");
        curl.easy_perform.logError();
        return false;
    }
    const int code = curl.easy_perform.call(curl.handle);
    if (code != curl_ok) NVR_LOG("curl upload file failed, errorcode %d", code);
    return code == curl_ok;
}

void endUpload(Curl_Library& curl)
{
    if (curl.easy_cleanup) {
        curl.easy_cleanup.call(std::exchange(curl.handle, nullptr));
    } else {
        NVR_LOG("unable to locate function curl_easy_cleanup in curl so");
        curl.easy_cleanup.logError();
    }
    curl.initialised = false;
    if (curl.global_cleanup) {
        curl.global_cleanup.call();
    } else {
        NVR_LOG("could not locate curl_global_cleanup in libcurl");
        curl.global_cleanup.logError();
    }
    if (!curl.close()) NVR_LOG("UNABLE TO CLOSE DYNAMIC LIB");
}

} // namespace

std::string NVR_MethodWrapper::downloadFileUsingCurl(const String& uri, uint32& returnValue, bool& fetched)
{
    NVR_LOG("Inside NVR_MethodWrapper::downloadFileUsingCurl");
    std::string path = uri.c_str();
    if (exists(path.c_str())) return path;
    NVR_LOG("File not found on local file system. Trying libcURL...");
    try {
        Download(uri, returnValue, fetched).run(path);
    } catch (...) {
        if (is_forced_unwind()) throw;
        NVR_LOG("ERROR: error caught in accessing Curl Library");
    }
    return path;
}

int NVR_MethodWrapper::uploadFileUsingCurl(const String& uri, const char* path)
{
    NVR_LOG("Inside NVR_MethodWrapper::uploadFileUsingCurl");
    if (!exists(path)) {
        NVR_LOG("couldnot locate the file %s, to be uploaded", path);
        return -1;
    }
    File file;
    Curl_Library curl;
    if (!beginUpload(curl)) {
        NVR_LOG("couldnot initialize curl library");
        return -1;
    }
    file = open_regular_file(path, "rb");
    if (!file) return 1;
    const long size = sizeOf(file.get());
    if (!curl.easy_setopt) {
        NVR_LOG("unable to locate function curl_easy_setopt in curl so");
        curl.easy_setopt.logError();
        return -1;
    }
    NVR_LOG("iFileSize size:: %d", static_cast<int>(size));
    NVR_LOG("URI.value.c_str(): %s", uri.c_str());
    // What is refused here ends the transfer without the words of its end.
    if (!setUploadOptions(curl, uri.c_str(), file.get(), size)) return -1;
    const bool sent = performUpload(curl);
    endUpload(curl);
    return sent ? 0 : -1;
}

} // namespace cimple
