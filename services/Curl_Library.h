/// libcurl for the time of one transfer: opened, its entries bound by name, and given back whole.
///
/// What is told when an entry is missing, and what then happens, is the caller's. Any thread; but libcurl's global
/// state is the process's, so callers serialise.
#pragma once

#include <cstddef>
#include <string>

namespace cimple {

/// The options of curl_easy_setopt that transfers set, by their published numbers.
enum Curl_Option : int {
    CURL_TIMEOUT = 13,
    CURL_INFILESIZE = 14,
    CURL_UPLOAD = 46,
    CURL_PUT = 54,
    CURL_SSL_VERIFYPEER = 64,
    CURL_SSL_VERIFYHOST = 81,
    CURL_HTTPAUTH = 107,
    CURL_FILE = 10001,
    CURL_URL = 10002,
    CURL_USERPWD = 10005,
    CURL_READDATA = 10009, // CURLOPT_INFILE is the same
    CURL_ERRORBUFFER = 10010,
    CURL_WRITEFUNCTION = 20011,
    CURL_INFILESIZE_LARGE = 30115
};

// Of libcurl's codes and limits.
constexpr int curl_ok = 0;
constexpr int curl_malformed_url = 3;
constexpr long curl_all_features = 3;
constexpr std::size_t curl_error_size = 256;

template <class Signature>
struct Curl_Entry {
    const char* name;
    Signature* call = nullptr; ///< null: the library lacks it
    std::string error = {};    ///< and then the loader's words for that

    explicit operator bool() const { return call != nullptr; }
    /// Logs the loader's words, if there are any.
    void logError() const;
};

struct Curl_Library {
    Curl_Library() = default;
    /// Ends what has begun and not ended, without a word: the handle, the global state, the library.
    ~Curl_Library() noexcept(false);
    Curl_Library(const Curl_Library&) = delete;
    Curl_Library& operator=(const Curl_Library&) = delete;

    /// False if no place has the library. The search logs its words; the entries do not.
    bool open();
    /// Logs the library's version, if it has that entry.
    void logVersion() const;
    /// False if the loader does not close it.
    bool close();

    Curl_Entry<char*()> version{"curl_version"};
    Curl_Entry<int(long features)> global_init{"curl_global_init"};
    Curl_Entry<void*()> easy_init{"curl_easy_init"};
    Curl_Entry<int(void* handle, int option, ...)> easy_setopt{"curl_easy_setopt"};
    Curl_Entry<int(void* handle)> easy_perform{"curl_easy_perform"};
    Curl_Entry<void(void* handle)> easy_cleanup{"curl_easy_cleanup"};
    Curl_Entry<void()> global_cleanup{"curl_global_cleanup"};

    void* handle = nullptr;   ///< of the transfer
    bool initialised = false; ///< the global state

private:
    template <class Signature>
    void bind(Curl_Entry<Signature>& entry);

    void* m_library = nullptr;
};

} // namespace cimple
