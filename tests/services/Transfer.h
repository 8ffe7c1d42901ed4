/// Transfers by libcurl under test: what the loader is asked for, where that leads, what is said, and what stays open.
#pragma once

#include <map>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>

#include "services/NVR_MethodWrapper.h"
#include "tests/support/curl_libraries.h"
#include "tests/support/file_server.h"
#include "tests/support/log_capture.h"
#include "tests/support/private_host.h"

namespace nvrtest {

using Words = std::vector<std::string>;

// What the code under test opens, and where that leads instead of where the loader would go.
extern std::vector<std::pair<std::string, int>> opened;
extern std::map<std::string, std::string> led_to;
extern bool loader_refuses; ///< to close

inline const std::string folder = "/var/log/here";   ///< where the program stands
inline const std::string served = "/var/log/served"; ///< what servers give
inline const Words search = {"Searching for /lib Curl on the machine", "Searching for /usr/lib/ Curl on the machine",
                             "Checking with libcurl.so system location for libcurl"};
inline const Words last_place = {"Checking with curl.dll windows system location for libcurl"};

Words joined(const std::vector<Words>& parts);
/// What is said of the system's library.
Words version_words();
/// The loader's words for an entry that is missing, among others.
std::string linking_error(const Words& all, const std::string& entry);
/// The names in a folder.
Words names_in(const std::string& path);

class Transfer : public testing::Test {
protected:
    Transfer();
    ~Transfer() override;

    /// Those of the test's folders that the process has open.
    static Words open_files();
    void use_stand_in(const std::string& lacking = "nothing");
    void refuse_option(int option, int use = 1)
    {
        stand_in->failing_option = option;
        stand_in->failing_option_use = use;
        stand_in->failing_code = 42;
    }

    Curl_Stand_In* stand_in = nullptr;
    int unended_handles = 0, uncleaned_globals = 0; // what a library that lacks the entry for it keeps

    /// What was said since it was asked last: so that no test passes by its result alone.
    Words words();

private:
    Log_Capture log;
};

} // namespace nvrtest
