/// What a stand-in for libcurl does besides forwarding to the system's own, and what it was asked to do.
///
/// Each stand-in exports one record of this kind, "curl_stand_in".
#pragma once

namespace nvrtest {

struct Curl_Stand_In {
    // Set by the test.
    int global_init_code = 0; ///< of curl_global_init; the library is not asked then
    bool refuses_handle = false;
    int failing_option = 0;     ///< 0: none
    int failing_option_use = 1; ///< which setting of it fails
    int failing_code = 0;
    int perform_code = 0; ///< of curl_easy_perform, if not 0; the library is not asked then
    bool throws = false;  ///< curl_easy_perform

    // Counted by the stand-in.
    int global_inits = 0, global_cleanups = 0;
    long features = 0;
    int handles = 0, handles_ended = 0;
    void* handle = nullptr; // the newest
    int performed = 0;
    static constexpr int most_options = 32;
    struct Option {
        int number;
        long long value; ///< of numbers; of pointers whether they are set
        char text[64];   ///< of URL and credentials, cut
    } options[most_options];
    int options_set = 0;
};

} // namespace nvrtest
