// The command's verb for firmware, from end to end.
#include <filesystem>
#include <unistd.h>

#include <gmock/gmock.h>

#include "tests/module/support/Command_Line.h"
#include "tests/module/support/Firmware.h"
#include "tests/support/curl_libraries.h"
#include "tests/support/file_server.h"
#include "tests/support/private_host.h"

using namespace nvrtest;
using testing::HasSubstr;
using testing::IsEmpty;

namespace {

class Firmware_Command : public testing::Test {
protected:
    Firmware_Command()
    {
        for (const char* folder : {firmware_folder, served_folder})
            std::filesystem::create_directories(folder);
        write_image(std::string(served_folder) + "/an.image");
        install_curl();
    }

    /// Where the image is fetched to.
    static Ended_Command run(const std::string& arguments, const std::string& scenario = "small",
                             const std::string& answer = "")
    {
        return nvrcim("firmware install " + arguments, scenario,
                      std::string("cd ") + firmware_folder + " && " + answer);
    }
};

} // namespace

TEST_F(Firmware_Command, WritesAFile)
{
    for (const host::Manner* manner : every_manner()) {
        const Ended_Command ended =
            nvrcim(std::string("--manner ") + manner->name + " firmware install --yes /var/log/served/an.image");
        EXPECT_EQ(ended.output, "firmware install, port 10000000C9A00001: done (0)\n");
        EXPECT_EQ(ended.status, 0);
    }
    EXPECT_EQ(run("-y --reset ../served/an.image").output, "firmware install, port 10000000C9A00001: done (0)\n");
    EXPECT_TRUE(exists(std::string(served_folder) + "/an.image"));
}

TEST_F(Firmware_Command, FetchesAnAddress)
{
    File_Server server("http", served_folder);
    // What libcurl's own libraries keep to the end counts as lost when the module has unloaded them.
    const Ended_Command ended =
        run(server.url() + "an.image --yes", "small", "ASAN_OPTIONS=\"$ASAN_OPTIONS:detect_leaks=0\"");
    EXPECT_EQ(ended.output, "firmware install, port 10000000C9A00001: done (0)\n");
    EXPECT_EQ(ended.status, 0);
    EXPECT_EQ(server.next_request(), "GET /an.image -");
    EXPECT_THAT(names_in(firmware_folder), IsEmpty());
}

TEST_F(Firmware_Command, TellsWhyNothingWasWritten)
{
    Ended_Command ended = run("nothing --yes");
    EXPECT_EQ(ended.output,
              "firmware install, port 10000000C9A00001: the image is not there, or could not be fetched (4107)\n");
    EXPECT_EQ(ended.status, 66);
    ended = run("/var/log/served --yes");
    EXPECT_EQ(ended.output, "firmware install, port 10000000C9A00001: the image is no file that can be read (5)\n");
    EXPECT_EQ(ended.status, 66);
    write_file(std::string(firmware_folder) + "/no.image", "nothing");
    ended = run("no.image --yes");
    EXPECT_THAT(ended.output, HasSubstr("the management library answered 1: "));
    EXPECT_THAT(ended.output, HasSubstr("(40001)\n"));
    EXPECT_EQ(ended.status, 66);
    EXPECT_EQ(run("").status, 64) << "no image is named";
}

TEST_F(Firmware_Command, AsksFirst)
{
    const Ended_Command ended = run("../served/an.image", "small", "echo n |");
    EXPECT_EQ(ended.status, 65);
    EXPECT_THAT(ended.output, HasSubstr("Write firmware to the adapter of port 10000000C9A00001? [y/N]"));
}
