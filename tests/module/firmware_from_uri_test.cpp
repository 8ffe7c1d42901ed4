// Firmware written from a file or URI.
#include <algorithm>
#include <filesystem>
#include <sys/stat.h>

#include <gmock/gmock.h>

#include "tests/module/support/Firmware.h"
#include "tests/support/Cases.h"
#include "tests/support/curl_libraries.h"
#include "tests/support/file_server.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using testing::Contains;
using testing::IsEmpty;
using testing::Not;

namespace {

const std::string local_image = "/var/log/an.image";
const std::string removing = "nvrcimDownloadFW: Removing the FW file from CIMOM's repository ";
const std::string complete = "FC download functionality complete for target " + std::string(first_port);
const std::string failed = "Error - in the firmware download functionality";

/// The words of a call on the first port up to where the file is known.
Words opening(std::size_t options = 0, unsigned first = 0)
{
    return joined({{"entering InstallFromURI", gate}, known_port(), options_words(options, first)});
}

Words opening_with_local_image(std::size_t options = 0, unsigned first = 0)
{
    return joined({opening(options, first), local_file(local_image), converted(first_port)});
}

/// As many of the last words as are expected.
Words ending(const Called& called, const Words& expected)
{
    const Words& all = called.words;
    return Words(all.end() - static_cast<std::ptrdiff_t>(std::min(expected.size(), all.size())), all.end());
}

} // namespace

class InstallFromUri : public Every_Manner {};
NVR_IN_EVERY_MANNER(InstallFromUri);

TEST_P(InstallFromUri, WritesALocalImageWhereItLiesAndKeepsIt)
{
    Firmware_Host host(*GetParam());
    write_image(local_image);
    ASSERT_NE(port_value(0, "firmware"), new_version);
    const Called installed = host.install(local_image);
    EXPECT_THAT(installed, returned(0));
    EXPECT_TRUE(installed.out("Job").is_null());
    EXPECT_EQ(installed.words,
              joined({opening_with_local_image(), downloaded(local_image), {complete, removing, gate_refreshing}}));
    EXPECT_EQ(port_value(0, "firmware"), new_version);
    EXPECT_TRUE(exists(local_image));
    EXPECT_EQ(port_value(0, "resets"), "0");
    EXPECT_THAT(host.rig.server().report().violations, IsEmpty());
}

TEST_P(InstallFromUri, TheNewVersionIsPublishedByTheNextEnumeration)
{
    Firmware_Host host(*GetParam());
    write_image(local_image);
    ASSERT_THAT(host.install(local_image), returned(0));
    host.rig.settle();
    Words versions;
    for (const host::Instance& identity : host.rig.enumerate("NVRHBA_SoftwareIdentity").instances)
        versions.push_back(identity.get("VersionString").as_text());
    EXPECT_THAT(versions, Contains(new_version));
}

TEST_P(InstallFromUri, TheMethodsNameIsTakenInAnyCase)
{
    Firmware_Host host(*GetParam());
    write_image(local_image);
    for (const char* name : {"installfromuri", "INSTALLFROMURI", "InstallFromURI"})
        EXPECT_THAT(host.service.call(name, {{"URI", host::Value::string(local_image)}, {"Target", host.target()}}),
                    returned(0))
            << name;
}

TEST_P(InstallFromUri, RefusesInTheOrderOfItsQuestions)
{
    Firmware_Host host(*GetParam());
    const host::Value bad = options_value({3});
    const host::Value nothing = host::Value::string("/var/log/nothing");

    // Everything is wrong with the first call; each of the next ones has one fault less.
    Called called = host.service.call_on(host.service.stranger(), "InstallFromURI", {{"InstallOptions", bad}});
    EXPECT_THAT(called, returned(33068));
    EXPECT_EQ(called.words,
              (Words{"entering InstallFromURI", gate, "Invalid instance of Software Installation Service"}));

    called = host.service.call("InstallFromURI", {{"InstallOptions", bad}});
    EXPECT_THAT(called, returned(4097));
    EXPECT_EQ(called.words, (Words{"entering InstallFromURI", gate, "Target has a null pointer"}));
    EXPECT_THAT(host.service.call("InstallFromURI", {{"Target", host::Value::null_of(CMPI_ref)}}), returned(4097));

    called = host.service.call("InstallFromURI", {{"Target", no_port(host.rig)}, {"InstallOptions", bad}});
    EXPECT_THAT(called, returned(32968));
    EXPECT_EQ(called.words, (Words{"entering InstallFromURI", gate,
                                   "NVRHBA_SoftwareInstallationService_Provider invald port ...return"}));

    called = host.service.call("InstallFromURI", {{"Target", unknown_port(host.rig)}, {"InstallOptions", bad}});
    EXPECT_THAT(called, returned(32968));
    EXPECT_EQ(called.words, joined({{"entering InstallFromURI", gate},
                                    no_known_port(),
                                    {"NVRHBA_SoftwareInstallationService_Provider invald port ...return"}}));

    for (const host::Value& uri : {host::Value::string(""), host::Value::null_of(CMPI_string)}) {
        called =
            host.service.call("InstallFromURI", {{"Target", host.target()}, {"URI", uri}, {"InstallOptions", bad}});
        EXPECT_THAT(called, returned(4097));
        EXPECT_EQ(called.words,
                  joined({{"entering InstallFromURI", gate}, known_port(), {"Null sized URI..returning"}}));
    }

    called =
        host.service.call("InstallFromURI", {{"Target", host.target()}, {"URI", nothing}, {"InstallOptions", bad}});
    EXPECT_THAT(called, returned(5));
    EXPECT_EQ(called.words, joined({opening(1, 3), {"invalid value of Install options"}}));

    called = host.service.call("InstallFromURI", {{"Target", host.target()}, {"URI", nothing}});
    EXPECT_THAT(called, returned(4107));
    EXPECT_EQ(called.words.back(), "ERROR: nvrcimDownloadFW: FW file not found");
    EXPECT_EQ(calls("RM_ImportHBAFileA"), 0u);
}

TEST_P(InstallFromUri, TakesTheOptionsThatItKnows)
{
    Firmware_Host host(*GetParam());
    write_image(local_image);
    const Called called = host.install(local_image, {4, 5, 6, 7, 11});
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.words,
              joined({opening_with_local_image(5, 4), downloaded(local_image), {complete, removing, gate_refreshing}}));
    for (const std::uint16_t unknown : {0, 1, 3, 8, 9, 10, 12, 32767, 32768, 32769, 65535}) {
        EXPECT_THAT(host.install(local_image, {unknown}), returned(5)) << unknown;
        EXPECT_THAT(host.install(local_image, {2, 4, unknown}), returned(5)) << unknown;
    }
    EXPECT_EQ(port_value(0, "resets"), "0");
}

TEST_P(InstallFromUri, FetchesAnImageAndRemovesIt)
{
    Firmware_Host host(*GetParam());
    install_curl();
    write_image(std::string(served_folder) + "/an.image");
    File_Server server("http", served_folder);
    const std::string uri = server.url() + "an.image";
    const Called called = host.install(uri);
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(server.next_request(), "GET /an.image -");
    EXPECT_THAT(called.words, contains_in_order({"Sending the URI " + uri + " to the Curl library",
                                                 "Successfully closed curl so", "filename is : an.image"}));
    const Words end =
        joined({{"filename is : an.image"},
                converted(first_port),
                downloaded("an.image"),
                {complete, removing, "nvrcimDownloadFW: FW file an.image removed successfully", gate_refreshing}});
    EXPECT_EQ(ending(called, end), end);
    EXPECT_EQ(port_value(0, "firmware"), new_version);
    EXPECT_THAT(names_in(firmware_folder), IsEmpty());
}

TEST_P(InstallFromUri, WithoutTheLibraryAUriIsNoFile)
{
    Firmware_Host host(*GetParam());
    for (const std::string& uri :
         {std::string("ftp://127.0.0.1/an.image"), std::string("an.image"), std::string("http://127.0.0.1/folder/")}) {
        const Called called = host.install(uri);
        EXPECT_THAT(called, returned(4107));
        EXPECT_EQ(called.words,
                  joined({opening(),
                          {"Inside NVR_MethodWrapper::downloadFileUsingCurl",
                           "File not found on local file system. Trying libcURL...",
                           "Searching for /lib Curl on the machine", "Searching for /usr/lib/ Curl on the machine",
                           "Checking with libcurl.so system location for libcurl",
                           "Checking with curl.dll windows system location for libcurl",
                           "ERROR: Could not load the curl library to download from internet", "filename is : " + uri,
                           "ERROR: nvrcimDownloadFW: FW file not found"}}));
    }
    EXPECT_THAT(names_in(firmware_folder), IsEmpty());
}

TEST_P(InstallFromUri, AStatusOfTheLibraryIsTold)
{
    Firmware_Host host(*GetParam());
    write_image(local_image);
    const struct {
        const char* call;
        std::uint32_t status;
        Words words;
    } rows[] = {
        {"RM_ImportHBAFileA", 27, importing(local_image, 27)},
        {"RM_VerifyFirmwareA", 5, joined({importing(local_image), verifying(5)})},
        {"RM_DownloadFirmware", 148, joined({importing(local_image), verifying(), downloading(148)})},
        {"RM_DownloadFirmware", 149, joined({importing(local_image), verifying(), downloading(149)})},
        {"RM_DownloadFirmware", 150, joined({importing(local_image), verifying(), downloading(150)})},
        {"RM_DownloadFirmware", 221, joined({importing(local_image), verifying(), downloading(221)})},
        {"RM_DownloadFirmware", 4711, joined({importing(local_image), verifying(), downloading(4711)})},
    };
    for (const auto& row : rows) {
        clear_faults();
        add_fault(std::string("call = '") + row.call + "', status = " + std::to_string(row.status));
        const Called called = host.install(local_image, {2});
        EXPECT_THAT(called, returned(40000 + row.status));
        EXPECT_EQ(called.words, joined({opening_with_local_image(1, 2), row.words, {status_line(row.status), failed}}));
    }
    EXPECT_EQ(calls("RM_ResetHBA"), 0u);
    EXPECT_EQ(calls("RM_DownloadFirmware"), 5u) << "nothing is asked twice";
    EXPECT_TRUE(exists(local_image));
}

TEST_P(InstallFromUri, AnImageForTheNextRebootIsASuccess)
{
    Firmware_Host host(*GetParam(), "[[adapter]]\n[[adapter.port]]\nfirmware_needs_reboot = true\n");
    install_curl();
    const std::string served = std::string(served_folder) + "/an.image";
    write_image(served);
    const Called called = host.install("file://" + served, {2});
    EXPECT_THAT(called, returned(0));
    const Words end = joined({converted(first_port),
                              importing("an.image"),
                              verifying(),
                              downloading(247),
                              {status_line(247),
                               "FC Firmware download completed for target " + std::string(first_port) +
                                   " Please reboot system to activate new firmware.",
                               removing, "nvrcimDownloadFW: FW file an.image removed successfully"},
                              reset_by_option()});
    EXPECT_EQ(ending(called, end), end);
    EXPECT_THAT(names_in(firmware_folder), IsEmpty());
}

TEST_P(InstallFromUri, APortThatIsNotLocalIsRefused)
{
    Firmware_Host host(*GetParam());
    write_image(local_image);
    add_fault("call = 'RM_IsLocalHBA', value = 0");
    const Called called = host.install(local_image);
    EXPECT_THAT(called, returned(40001));
    EXPECT_EQ(called.words,
              joined({opening_with_local_image(), {"entering the nvrcimDownloadFW function"}, not_local(), {failed}}));
}

TEST_P(InstallFromUri, AMissingEntryIsAFailure)
{
    Firmware_Host host(*GetParam());
    write_image(local_image);
    for (const char* call : {"RM_IsLocalHBA", "RM_ImportHBAFileA", "RM_VerifyFirmwareA", "RM_DownloadFirmware"}) {
        clear_faults();
        add_fault(std::string("call = '") + call + "', absent = true");
        EXPECT_THAT(host.install(local_image), returned(40001)) << call;
    }
}

TEST_P(InstallFromUri, ResetsOnceForEachTimeItIsAsked)
{
    Firmware_Host host(*GetParam());
    write_image(local_image);
    const Called called = host.install(local_image, {2, 4, 2});
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.words, joined({opening_with_local_image(3, 2),
                                    downloaded(local_image),
                                    {complete, removing},
                                    reset_by_option(),
                                    reset_by_option()}))
        << "and no refresh is asked for";
    EXPECT_EQ(port_value(0, "resets"), "2");
}

TEST_P(InstallFromUri, AFailedResetIsTheAnswer)
{
    Firmware_Host host(*GetParam(), "[[adapter]]\n[[adapter.port]]\nreset_ms = 3600000\n");
    write_image(local_image);
    // The adapter is still about its first reset when the second one is asked for.
    const Called called = host.install(local_image, {2, 2});
    EXPECT_THAT(called, returned(40064));
    EXPECT_EQ(called.words,
              joined({opening_with_local_image(2, 2),
                      downloaded(local_image),
                      {complete, removing},
                      reset_by_option(),
                      {"HBA RESET OPTION SELECTED", "NVR_MethodWrapper::nvrcimReset"},
                      local(),
                      {status_line(64), "NVRHBA_SoftwareInstallationService_Provider::nvrcimResetHBA failed"}}));
    EXPECT_EQ(port_value(0, "firmware"), new_version) << "the image stays written";
}

TEST_P(InstallFromUri, WhatIsNoImageIsRefusedAndAFetchedFileStays)
{
    Firmware_Host host(*GetParam());
    install_curl();
    std::string damaged = image();
    damaged[1000] ^= 1;
    const std::string served = std::string(served_folder) + "/an.image";
    for (const std::string& content : {std::string(), std::string("too short"), image().substr(0, 4000), damaged}) {
        write_file(served, content);
        const Called called = host.install("file://" + served);
        EXPECT_THAT(called, returned(40001));
        EXPECT_EQ(called.words.back(), failed);
        EXPECT_THAT(called.words, Not(Contains(removing)));
        EXPECT_EQ(read_file("an.image"), content);
        remove("an.image");
        EXPECT_THAT(host.install(served), returned(40001));
    }
    EXPECT_EQ(calls("RM_DownloadFirmware"), 0u);
}

TEST_P(InstallFromUri, WhatTheTransferLeavesIsJudgedByTheFile)
{
    Firmware_Host host(*GetParam());
    install_curl();
    // Nobody answers: an empty file, which is no image.
    Called called = host.install(deserted_url() + "empty");
    EXPECT_THAT(called, returned(40001));
    EXPECT_EQ(read_file("empty"), "");
    // No address: the whole text comes back, and the empty file stays.
    const std::string malformed = "http://127.0.0.1:99999999/malformed";
    called = host.install(malformed);
    EXPECT_THAT(called, returned(4107));
    EXPECT_THAT(called.words, contains_in_order({"download failed 3", "filename is : " + malformed,
                                                 "ERROR: nvrcimDownloadFW: FW file not found"}));
    EXPECT_EQ(read_file("malformed"), "");
    // A library that lacks something counts only by what it leaves.
    install_curl_without("curl_easy_init");
    called = host.install("http://127.0.0.1/lacking");
    EXPECT_THAT(called, returned(40001));
    EXPECT_EQ(read_file("lacking"), "");
}

TEST_P(InstallFromUri, PathsThatAreNoFilesAreRefusedWithoutWaiting)
{
    Firmware_Host host(*GetParam());
    ASSERT_EQ(::mkfifo("fifo", 0600), 0);
    make_folder("folder");
    nvrtest::make_link("/dev/zero", "device");
    nvrtest::make_link("nowhere", "dangling");
    const Words before = names_in(firmware_folder);
    for (const char* path : {"fifo", "folder", "device", "/dev/null", "/var/log/"}) {
        const Called called = host.install(path);
        EXPECT_THAT(called, returned(5)) << path;
        EXPECT_EQ(called.words,
                  joined({opening(), local_file(path), {"ERROR: nvrcimDownloadFW: Can't stat FW file "}}));
    }
    EXPECT_THAT(host.install("dangling"), returned(4107));
    EXPECT_EQ(names_in(firmware_folder), before);
    EXPECT_EQ(calls("RM_ImportHBAFileA"), 0u);
}

TEST_P(InstallFromUri, AFileIsNoFolder)
{
    Firmware_Host host(*GetParam());
    write_image("an.image");
    const Called called = host.install("an.image/inside");
    EXPECT_THAT(called, returned(5));
    EXPECT_EQ(called.words.end()[-2], "filename is : an.image/inside");
    EXPECT_EQ(called.words.back(), "ERROR: nvrcimDownloadFW: Can't stat FW file ");
    EXPECT_EQ(names_in(firmware_folder), Words{"an.image"});
}

// What came of the image is judged by the adapter, and stays as any fetched image that is refused.
TEST_P(InstallFromUri, AFullDiskLeavesAPartThatIsNoImage)
{
    Firmware_Host host(*GetParam());
    install_curl();
    const std::string served = std::string(served_folder) + "/an.image";
    write_file(served, image(new_version, 200000));
    mount_small_disk(firmware_folder, 64);
    std::filesystem::current_path(firmware_folder);
    const Called called = host.install("file://" + served);
    EXPECT_THAT(called, returned(40001));
    EXPECT_THAT(called.words, contains_in_order({"download failed 23", "filename is : an.image", failed}));
    EXPECT_EQ(names_in(firmware_folder), Words{"an.image"});
    EXPECT_EQ(calls("RM_DownloadFirmware"), 0u);
}

TEST_P(InstallFromUri, StrangeUrisAreTakenLetterForLetter)
{
    Firmware_Host host(*GetParam());
    for (const std::string name : {"%s%n%d", "quoted \"and\" 'so'", "two\nlines", "..x..", "a%2fb"}) {
        write_image(std::string(firmware_folder) + "/" + name);
        EXPECT_THAT(host.install(name), returned(0)) << name;
        EXPECT_THAT(host.install("nothing " + name), returned(4107)) << name;
        EXPECT_THAT(host.install("/nothing/" + name + "/"), returned(4107)) << name;
    }
    std::string cut = "%s%n%d";
    cut += '\0';
    cut += "behind";
    EXPECT_THAT(host.install(cut), returned(0)) << "a text ends at its zero byte";
    const std::string longest(65536, 'x');
    EXPECT_THAT(host.install(longest), returned(5)) << "too long a path to look at";
    install_curl();
    EXPECT_THAT(host.install("http://127.0.0.1/" + longest), returned(5));
    EXPECT_THAT(host.install("http://127.0.0.1/folder/"), returned(4107));
    EXPECT_THAT(host.install("http://127.0.0.1/.."), returned(5)) << "a folder";
    EXPECT_EQ(names_in(firmware_folder).size(), 5u);
}

TEST(InstallFromUriOnce, EachStatusComesBackBehindFortyThousand)
{
    Firmware_Host host;
    write_image(local_image);
    const unsigned each = each_of_cases(1, 13); // 247 is among them
    for (std::uint32_t status = each; status <= 260; status += each) {
        clear_faults();
        add_fault("call = 'RM_DownloadFirmware', status = " + std::to_string(status));
        const Called called = host.install(local_image);
        EXPECT_THAT(called, returned(status == 247 ? 0 : 40000 + status));
        host.rig.forget_words();
    }
}
