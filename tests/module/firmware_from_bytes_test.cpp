// Firmware written from bytes in the call.
#include <algorithm>
#include <sys/stat.h>

#include <gmock/gmock.h>

#include "tests/module/support/Firmware.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using testing::IsEmpty;

namespace {

const std::string copy = "/var/log/firmware/a.copy";
const std::string removing = "nvrcimDownloadFW: Removing the FW file from CIMOM's repository ";
const std::string removed = "nvrcimDownloadFW: FW file " + copy + " removed successfully";
const std::string complete = "FC download functionality complete for target " + std::string(first_port);
const std::string failed = "Error - in the firmware download functionality";
const std::string no_values =
    "InstallOptionsValues is empty. Should have the correct firmware file name. Returning Invalid Parameter";
const std::string no_file_option = "InstallOptions does not have the value 32768";
const std::string not_opened = "Could not open file to copy the firmware from ByteStream";

/// The words of a call on the first port up to the options.
Words opening()
{
    return joined({{"Entering InstallFromByteStream", gate}, known_port()});
}

Words with_file(std::size_t options, unsigned first, const std::string& path = copy)
{
    return joined({opening(), options_words(options, first), {"filename is : " + path}});
}

} // namespace

class InstallFromBytes : public Every_Manner {};
NVR_IN_EVERY_MANNER(InstallFromBytes);

TEST_P(InstallFromBytes, WritesTheImageByWayOfAFile)
{
    Firmware_Host host(*GetParam());
    const Called installed = host.install_bytes(image(), {32768}, {copy});
    EXPECT_THAT(installed, returned(0));
    EXPECT_TRUE(installed.out("Job").is_null());
    EXPECT_EQ(installed.words, joined({with_file(1, 32768),
                                       converted(first_port),
                                       downloaded(copy),
                                       {removing, removed, complete, gate_refreshing}}));
    EXPECT_EQ(port_value(0, "firmware"), new_version);
    EXPECT_THAT(names_in(firmware_folder), IsEmpty());
    EXPECT_THAT(host.rig.server().report().violations, IsEmpty());
}

TEST_P(InstallFromBytes, TheMethodsNameIsTakenInAnyCase)
{
    Firmware_Host host(*GetParam());
    for (const char* name : {"installfrombytestream", "INSTALLFROMBYTESTREAM"})
        EXPECT_THAT(host.service.call(name, {}), returned(4097)) << name;
}

TEST_P(InstallFromBytes, RefusesInTheOrderOfItsQuestions)
{
    Firmware_Host host(*GetParam());
    const auto call = [&](const Arguments& arguments) { return host.service.call("InstallFromByteStream", arguments); };
    const Arguments bad = {{"InstallOptions", options_value({3})}};
    const auto with = [](Arguments arguments, const char* name, const host::Value& value) {
        arguments.push_back({name, value});
        return arguments;
    };

    Called called = host.service.call_on(host.service.stranger(), "InstallFromByteStream", bad);
    EXPECT_THAT(called, returned(33068));
    EXPECT_EQ(called.words,
              (Words{"Entering InstallFromByteStream", gate, "Invalid instance of Software Installation Service"}));

    called = call(bad);
    EXPECT_THAT(called, returned(4097));
    EXPECT_EQ(called.words, (Words{"Entering InstallFromByteStream", gate, "Target has a null pointer"}));

    called = call(with(bad, "Target", no_port(host.rig)));
    EXPECT_THAT(called, returned(32968));
    EXPECT_EQ(called.words, (Words{"Entering InstallFromByteStream", gate,
                                   "NVRHBA_SoftwareInstallationService_Provider::Wrong DeviceID passed"}));

    called = call(with(bad, "Target", unknown_port(host.rig)));
    EXPECT_THAT(called, returned(32968));
    EXPECT_EQ(called.words, joined({{"Entering InstallFromByteStream", gate},
                                    no_known_port(),
                                    {"NVRHBA_SoftwareInstallationService_Provider::Wrong DeviceID passed"}}));

    for (const host::Value& values : {host::Value(), host::Value::null_of(CMPI_stringA), texts_value({})}) {
        called = call(with(with(bad, "Target", host.target()), "InstallOptionsValues", values));
        EXPECT_THAT(called, returned(5));
        EXPECT_EQ(called.words, joined({opening(), {no_values}}));
    }

    called = call({{"Target", host.target()}, {"InstallOptionsValues", texts_value({copy})}});
    EXPECT_THAT(called, returned(5));
    EXPECT_EQ(called.words, joined({opening(), options_words(0, 0), {no_file_option}}));

    called = host.install_bytes(image(), {32768, 3}, {copy});
    EXPECT_THAT(called, returned(5));
    EXPECT_EQ(called.words, joined({opening(), options_words(2, 32768), {"invalid value of Install options"}}));

    called = host.install_bytes(image(), {2, 4}, {copy});
    EXPECT_THAT(called, returned(5));
    EXPECT_EQ(called.words, joined({opening(), options_words(2, 2), {no_file_option}}));

    called = host.install_bytes(image(), {4, 32768}, {copy});
    EXPECT_THAT(called, returned(5)) << "there is no value at the option's place";
    EXPECT_EQ(called.words, joined({opening(), options_words(2, 4), {no_values}}));

    EXPECT_THAT(names_in(firmware_folder), IsEmpty());
    EXPECT_EQ(calls("RM_ImportHBAFileA"), 0u);
}

TEST_P(InstallFromBytes, TheLastFileOptionNamesTheFile)
{
    Firmware_Host host(*GetParam());
    const Called called = host.install_bytes(image(), {4, 32768, 11, 32768, 7}, {"a", "b", "c", copy, "e", "f"});
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.words, joined({with_file(5, 4),
                                    converted(first_port),
                                    downloaded(copy),
                                    {removing, removed, complete, gate_refreshing}}));
    EXPECT_THAT(names_in(firmware_folder), IsEmpty());
}

TEST_P(InstallFromBytes, ResetsAfterAGoodDownload)
{
    Firmware_Host host(*GetParam());
    const Called called = host.install_bytes(image(), {2, 32768, 2}, {"unused", copy});
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.words, joined({with_file(3, 2),
                                    converted(first_port),
                                    downloaded(copy),
                                    {removing, removed, complete},
                                    reset_by_option(),
                                    reset_by_option()}));
    EXPECT_EQ(port_value(0, "resets"), "2");
}

TEST_P(InstallFromBytes, AFailedDownloadRemovesTheFileAndDoesNotReset)
{
    Firmware_Host host(*GetParam());
    for (const std::uint32_t status : {1u, 148u, 149u, 150u, 247u}) {
        clear_faults();
        add_fault("call = 'RM_DownloadFirmware', status = " + std::to_string(status));
        const Called called = host.install_bytes(image(), {2, 32768}, {"unused", copy});
        EXPECT_THAT(called, returned(40000 + status));
        EXPECT_EQ(called.words, joined({with_file(2, 2),
                                        converted(first_port),
                                        importing(copy),
                                        verifying(),
                                        downloading(status),
                                        {status_line(status), removing, removed, failed}}));
        EXPECT_THAT(names_in(firmware_folder), IsEmpty());
    }
    EXPECT_EQ(port_value(0, "resets"), "0");
}

TEST_P(InstallFromBytes, AFailedResetIsTheAnswer)
{
    Firmware_Host host(*GetParam());
    add_fault("call = 'RM_ResetHBA', status = 190");
    const Called called = host.install_bytes(image(), {32768, 2}, {copy});
    EXPECT_THAT(called, returned(40190));
    const Words end =
        joined({{removing, removed, complete, "HBA RESET OPTION SELECTED", "NVR_MethodWrapper::nvrcimReset"},
                local(),
                {status_line(190), "NVRHBA_SoftwareInstallationService_Provider::nvrcimResetHBA failed"}});
    ASSERT_GE(called.words.size(), end.size());
    EXPECT_EQ(Words(called.words.end() - static_cast<long>(end.size()), called.words.end()), end);
    EXPECT_EQ(port_value(0, "firmware"), new_version);
    EXPECT_THAT(names_in(firmware_folder), IsEmpty());
}

TEST_P(InstallFromBytes, APortThatIsNotLocalIsRefused)
{
    Firmware_Host host(*GetParam());
    add_fault("call = 'RM_IsLocalHBA', value = 0");
    const Called called = host.install_bytes(image(), {32768}, {copy});
    EXPECT_THAT(called, returned(40001));
    EXPECT_EQ(called.words, joined({with_file(1, 32768),
                                    converted(first_port),
                                    {"entering the nvrcimDownloadFW function"},
                                    not_local(),
                                    {removing, removed, failed}}));
    EXPECT_THAT(names_in(firmware_folder), IsEmpty());
}

TEST_P(InstallFromBytes, WhatIsNoImageIsRefusedAndRemoved)
{
    Firmware_Host host(*GetParam());
    std::string damaged = image();
    damaged[1000] ^= 1;
    for (const std::string& bytes : {std::string(), std::string("too short"), image().substr(0, 4000), damaged}) {
        const Called called = host.install_bytes(bytes, {32768}, {copy});
        EXPECT_THAT(called, returned(40001));
        EXPECT_EQ(called.words, joined({with_file(1, 32768),
                                        converted(first_port),
                                        importing(copy),
                                        verifying(1),
                                        {status_line(1), removing, removed, failed}}));
        EXPECT_THAT(names_in(firmware_folder), IsEmpty());
    }
    const Called without = host.service.call("InstallFromByteStream", {{"Target", host.target()},
                                                                       {"InstallOptions", options_value({32768})},
                                                                       {"InstallOptionsValues", texts_value({copy})}});
    EXPECT_THAT(without, returned(40001)) << "no image is an empty one";
    EXPECT_THAT(names_in(firmware_folder), IsEmpty());
    EXPECT_EQ(calls("RM_DownloadFirmware"), 0u);
}

TEST_P(InstallFromBytes, WritesToNothingButAFile)
{
    Firmware_Host host(*GetParam());
    ASSERT_EQ(::mkfifo("fifo", 0600), 0);
    make_folder("folder");
    nvrtest::make_link("/dev/null", "device");
    nvrtest::make_link("nowhere", "dangling");
    write_file("a.file", "");
    const Words before = names_in(firmware_folder);
    for (const std::string& path :
         {std::string(""), std::string("fifo"), std::string("folder"), std::string("device"), std::string("dangling"),
          std::string("/nothing/a.copy"), std::string("folder/"), std::string(".."), std::string("a.file/inside"),
          std::string("a.file/"), std::string(65536, 'x')}) {
        const Called called = host.install_bytes(image(), {32768}, {path});
        EXPECT_THAT(called, returned(4)) << path;
        EXPECT_EQ(called.words, joined({with_file(1, 32768, path), {not_opened}}));
    }
    EXPECT_EQ(names_in(firmware_folder), before);
}

TEST_P(InstallFromBytes, StrangePathsAreTakenLetterForLetter)
{
    Firmware_Host host(*GetParam());
    for (const std::string& path :
         {std::string("%s%n%d"), std::string("quoted \"and\" 'so'"), std::string("two\nlines"),
          std::string("../firmware/x"), std::string("cut\0behind", 10)}) {
        EXPECT_THAT(host.install_bytes(image(), {32768}, {path}), returned(0)) << path;
        EXPECT_THAT(names_in(firmware_folder), IsEmpty());
    }
}

TEST_P(InstallFromBytes, AFileThatIsThereIsReplacedAndGoes)
{
    Firmware_Host host(*GetParam());
    write_file(copy, std::string(100000, 'o'));
    EXPECT_THAT(host.install_bytes(image(), {32768}, {copy}), returned(0));
    EXPECT_EQ(port_value(0, "firmware"), new_version);
    EXPECT_THAT(names_in(firmware_folder), IsEmpty());
}

TEST_P(InstallFromBytes, AFileThatCannotBeRemovedIsTold)
{
    Firmware_Host host(*GetParam());
    write_file(copy, "");
    cover_file(copy, ""); // what something is mounted on stays
    const Called called = host.install_bytes(image(), {32768}, {copy});
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.words,
              joined({with_file(1, 32768),
                      converted(first_port),
                      downloaded(copy),
                      {removing, "nvrcimDownloadFW: Can't stat file " + copy, complete, gate_refreshing}}));
}

// The link is what goes in the end, as any path that an image is written by.
TEST_P(InstallFromBytes, AFullDiskLeavesNoPartBehindALink)
{
    Firmware_Host host(*GetParam());
    make_folder("/var/log/disk");
    mount_small_disk("/var/log/disk", 16);
    write_file("/var/log/disk/image", "old");
    nvrtest::make_link("/var/log/disk/image", copy);
    const Called called = host.install_bytes(image(new_version, 60000), {32768}, {copy});
    EXPECT_THAT(called, returned(4));
    EXPECT_EQ(called.words, joined({with_file(1, 32768), {not_opened}}));
    EXPECT_EQ(read_file("/var/log/disk/image"), "");
    EXPECT_THAT(host.install_bytes(image(), {32768}, {copy}), returned(0));
    EXPECT_THAT(names_in(firmware_folder), IsEmpty());
}

TEST_P(InstallFromBytes, AFullDiskLeavesNoFile)
{
    Firmware_Host host(*GetParam());
    mount_small_disk(firmware_folder, 16);
    const Called called = host.install_bytes(image(new_version, 60000), {32768}, {copy});
    EXPECT_THAT(called, returned(4));
    EXPECT_EQ(called.words, joined({with_file(1, 32768), {not_opened}}));
    EXPECT_THAT(names_in(firmware_folder), IsEmpty());
    EXPECT_THAT(host.install_bytes(image(new_version, 5000), {32768}, {copy}), returned(0));
}

TEST(InstallFromBytesOnce, EachStatusComesBackBehindFortyThousand)
{
    Firmware_Host host;
    const std::string bytes = image(new_version, 10);
    for (std::uint32_t status = 1; status <= 260; status++) {
        clear_faults();
        add_fault("call = 'RM_ImportHBAFileA', status = " + std::to_string(status));
        EXPECT_THAT(host.install_bytes(bytes, {32768}, {copy}), returned(40000 + status));
    }
    EXPECT_THAT(names_in(firmware_folder), IsEmpty());
}
