// The module's settings files, sound and broken in every line: no fault in them stops the module.
#include <cerrno>
#include <dlfcn.h>
#include <pthread.h>
#include <string>
#include <sys/stat.h>
#include <vector>

#include <gmock/gmock.h>

#include "tests/module/support/Entries.h"
#include "tests/module/support/Rig.h"
#include "tests/support/private_host.h"
#include "tests/support/trace.h"

using namespace nvrtest;
using testing::Contains;
using testing::IsEmpty;
using testing::Not;

namespace {

constexpr char smis_path[] = "/etc/nvr_smis.conf";

std::string currents(Rig& rig)
{
    std::string all;
    for (const host::Instance& instance : rig.enumerate("NVRHBA_ProviderConfigSetting").instances)
        all += (all.empty() ? "" : " ") + instance.get("current").to_text();
    return all;
}

struct Settings {
    friend void PrintTo(const Settings& settings, std::ostream* os) { *os << settings.label; }
    const char* label;
    std::string text;
    const char* currents; // minutes, adapters, SAN
};

std::string lines(int count)
{
    std::string text;
    for (int i = 0; i < count; i++)
        text += "#\n";
    return text;
}

const Settings settings[] = {
    {"Sound",
     "NVR_PROVIDER_CACHE_TIMEOUT = 20\nNVR_PROVIDER_REFRESH_ADAPTERDATA = TRUE\nNVR_PROVIDER_REFRESH_SANDATA = FALSE\n",
     "20 1 0"},
    {"WithoutBlanksAndLastLineEnd", "NVR_PROVIDER_REFRESH_SANDATA=FALSE\nNVR_PROVIDER_CACHE_TIMEOUT=1", "1 0 0"},
    {"WithBlanksAndComments", "  # x\n\t NVR_PROVIDER_CACHE_TIMEOUT \t=  30  \n#NVR_PROVIDER_CACHE_TIMEOUT = 5\n",
     "30 0 1"},
    {"MinutesAboveTheRange", "NVR_PROVIDER_CACHE_TIMEOUT = 31\n", "10 0 1"},
    {"MinutesBelowTheRange", "NVR_PROVIDER_CACHE_TIMEOUT = 0\n", "10 0 1"},
    {"MinutesNegative", "NVR_PROVIDER_CACHE_TIMEOUT = -5\n", "10 0 1"},
    {"MinutesBeyondAnyNumber", "NVR_PROVIDER_CACHE_TIMEOUT = 99999999999999999999999\n", "10 0 1"},
    {"MinutesThatAreWords", "NVR_PROVIDER_CACHE_TIMEOUT = many\n", "10 0 1"},
    {"AValidLineBehindABrokenOne",
     "NVR_PROVIDER_CACHE_TIMEOUT = 31\nNVR_PROVIDER_CACHE_TIMEOUT = 20\nNVR_PROVIDER_CACHE_TIMEOUT = 5\n", "20 0 1"},
    {"WordsInSmallLetters", "NVR_PROVIDER_REFRESH_SANDATA = false\nNVR_PROVIDER_REFRESH_ADAPTERDATA = true\n",
     "10 0 1"},
    {"WordsWithATail", "NVR_PROVIDER_REFRESH_SANDATA = FALSE;\nNVR_PROVIDER_REFRESH_ADAPTERDATA = TRUEST\n", "10 0 1"},
    {"WordsThatAreNumbers", "NVR_PROVIDER_REFRESH_SANDATA = 0\nNVR_PROVIDER_REFRESH_ADAPTERDATA = 1\n", "10 0 1"},
    {"KeysInSmallLetters", "nvr_provider_cache_timeout = 20\n", "10 0 1"},
    {"KeysWithoutValues", "NVR_PROVIDER_CACHE_TIMEOUT =\nNVR_PROVIDER_REFRESH_SANDATA\n= FALSE\n=\n", "10 0 1"},
    {"UnknownKeys", "SOMETHING = ELSE\nNVR_PROVIDER_CACHE_TIMEOUT_ = 20\n", "10 0 1"},
    {"Empty", "\n", "10 0 1"},
    {"Binary",
     std::string("\x7f"
                 "ELF\0\xff\xfe=\0\n\0\0\n",
                 13),
     "10 0 1"},
    {"ALineLongerThanTheBuffer", std::string(5000, 'x') + "\nNVR_PROVIDER_CACHE_TIMEOUT = 20\n", "20 0 1"},
    {"AnEndlessLine", std::string(300000, '='), "10 0 1"},
    {"AKeyOnTheLastLineThatIsLookedAt", lines(999) + "NVR_PROVIDER_CACHE_TIMEOUT = 20\n", "20 0 1"},
    {"AKeyBehindIt", lines(1000) + "NVR_PROVIDER_CACHE_TIMEOUT = 20\n", "10 0 1"},
};

} // namespace

class Settings_File : public testing::TestWithParam<Settings> {};

TEST_P(Settings_File, GivesTheseValues)
{
    Rig rig({host::Manner::strict(), "small", GetParam().text});
    EXPECT_EQ(currents(rig), GetParam().currents);
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u);
}

INSTANTIATE_TEST_SUITE_P(That, Settings_File, testing::ValuesIn(settings),
                         [](const auto& info) { return "Is" + std::string(info.param.label); });

TEST(SettingsFile, ThatIsAFolderIsPassedOver)
{
    remove(conf_path);
    Rig rig({host::Manner::strict(), "small"});
    make_folder(conf_path);
    EXPECT_EQ(currents(rig), "10 0 1");
    rig.stop();
    remove(conf_path);
}

TEST(SettingsFile, ThatCannotBeOpenedIsPassedOver)
{
    Rig rig({host::Manner::strict(), "small", "NVR_PROVIDER_CACHE_TIMEOUT = 20\n"});
    make_unopenable(conf_path);
    EXPECT_EQ(currents(rig), "10 0 1");
    rig.stop();
}

TEST(SettingsFile, ThatCannotBeReadIsLeftAsItIs)
{
    Rig rig({host::Manner::strict(), "small", "NVR_PROVIDER_CACHE_TIMEOUT = 20\n"});
    rig.server().on_request_thread([](const CMPIBroker* broker, const CMPIContext* context) {
        Entries entries;
        errno = ENOENT; // of the server's own doing; it keeps the file from being read
        CMPIInstanceMI* ports = entries.instances("NVRHBA_FCPort", broker, context);
        ASSERT_TRUE(ports);
        EXPECT_EQ(ports->ft->cleanup(ports, context, 1).rc, CMPI_RC_OK);
    });
    EXPECT_EQ(read_file(conf_path), "NVR_PROVIDER_CACHE_TIMEOUT = 20\n");
    EXPECT_EQ(currents(rig), "20 0 1");
}

TEST(SettingsFiles, OnAFullDiskTakeWhatWasSet)
{
    make_folder("/var/log/disk");
    const Small_Disk disk("/var/log/disk");
    write_file("/var/log/disk/conf", "NVR_PROVIDER_CACHE_TIMEOUT = 20\n");
    write_file("/var/log/disk/dmp", "2,5,1\n" + std::string(trace_path));
    Rig rig({host::Manner::strict(), "small"});
    make_link("/var/log/disk/conf", conf_path);
    make_link("/var/log/disk/dmp", dmp_path);
    disk.fill();
    host::Instance setting = rig.enumerate("NVRHBA_ProviderConfigSetting").instances.at(0);
    setting.set("current", host::Value::uint32(3));
    ASSERT_THAT(rig.server().modify(setting, std::vector<std::string>{"current"}), succeeded());
    rig.restart();
    EXPECT_EQ(currents(rig), "3 0 1");
    EXPECT_EQ(read_file(dmp_path), "2,5,1\n" + std::string(trace_path));
    rig.stop();
    remove(conf_path);
    remove(dmp_path);
}

TEST(SettingsFiles, ThatAFullDiskRefusesAreWrittenAtTheEnd)
{
    make_folder("/var/log/disk");
    Rig rig({host::Manner::strict(), "small"});
    const host::Instance log = rig.enumerate("NVRHBA_RecordLog").instances.at(0);
    {
        const Small_Disk disk("/var/log/disk");
        remove(dmp_path);
        make_link("/var/log/disk/dmp", dmp_path);
        disk.fill();
        const host::Answer set = rig.server().call(log.path, "SetLogParams",
                                                   {{"LogLevel", host::Value::uint16(5)},
                                                    {"LogMode", host::Value::uint16(4)},
                                                    {"TracePath", host::Value::string(trace_path)}});
        ASSERT_THAT(set, succeeded());
        ASSERT_EQ(set.value.as_uint(), 0u);
        EXPECT_EQ(read_file("/var/log/disk/dmp"), "");
        remove(dmp_path);
    }
    rig.stop();
    EXPECT_EQ(read_file(dmp_path), "4,5,1\n" + std::string(trace_path));
}

// --- A request that is cancelled
// --------------------------------------------------------------------------------------------------

namespace {

struct First_Request {
    const CMPIBroker* broker;
    const CMPIContext* context;
    CMPIInstanceMI* (*factory)(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
    CMPIInstanceMI* made = nullptr;
};

void* ask_and_be_cancelled(void* data)
{
    auto* request = static_cast<First_Request*>(data);
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    ::pthread_cancel(::pthread_self());
    request->made = request->factory(request->broker, request->context, &status);
    ::pthread_testcancel();
    return nullptr;
}

} // namespace

TEST(SettingsFiles, OutliveAFirstRequestThatIsCancelled)
{
    const std::string conf = "NVR_PROVIDER_CACHE_TIMEOUT = 20\n";
    Rig rig({host::Manner::strict(), "small"});
    const Entries module;
    write_file(conf_path, conf);
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        void* const factory = dlsym(module.handle(), "NVRHBA_ProviderConfigSetting_Create_InstanceMI");
        First_Request request{broker, context, reinterpret_cast<decltype(First_Request::factory)>(factory)};
        pthread_t thread;
        void* result = nullptr;
        ASSERT_EQ(::pthread_create(&thread, nullptr, ask_and_be_cancelled, &request), 0);
        ASSERT_EQ(::pthread_join(thread, &result), 0);
        EXPECT_EQ(result, PTHREAD_CANCELED);
        EXPECT_EQ(read_file(conf_path), conf);
        ASSERT_TRUE(request.made);
        EXPECT_EQ(request.made->ft->cleanup(request.made, context, 1).rc, CMPI_RC_OK);
    });
    EXPECT_THAT(read_file(conf_path), testing::HasSubstr(conf));
    EXPECT_EQ(read_file(dmp_path), "2,5,1\n" + std::string(trace_path));
}

// --- The log's settings
// --------------------------------------------------------------------------------------------------

namespace {

struct Log_Settings {
    friend void PrintTo(const Log_Settings& settings, std::ostream* os) { *os << settings.label; }
    const char* label;
    std::string first_line;
    bool is_written; // a record of the module reaches the trace file
};

const Log_Settings log_settings[] = {
    {"FileOnly", "2,5,1\n", true},
    {"FileAndRing", "4,5,1\n", true},
    {"LevelThatDoesNotMatter", "2,1,1\n", true},
    {"LevelZero", "2,0,1\n", true},
    {"NegativeEnabledCountsAsEnabledButEndsTheReading", "2,5,-1\n", false},
    {"Disabled", "2,5,0\n", false},
    {"RingOnly", "1,5,1\n", false},
    {"Off", "0,5,1\n", false},
    {"Neither", "3,5,1\n", false},
    {"ModeTooHigh", "5,5,1\n", false},
    {"ModeNegative", "-1,5,1\n", false},
    {"LevelTooHigh", "4,6,1\n", false},
    {"LevelMissing", "2\n", false},
    {"EnabledMissing", "2,5\n", false},
    {"OnlyCommas", ",,,\n", false},
    {"Empty", "\n", false},
    // What the buffer does not take is read as the path.
    {"LineLongerThanItsBuffer", "2,5,1,             /no/such/folder/x\n", false},
    {"Binary", std::string("\0\xff,\0\n", 5), false},
};

} // namespace

class Log_Settings_File : public testing::TestWithParam<Log_Settings> {};

TEST_P(Log_Settings_File, DecidesWhetherTheTraceIsWritten)
{
    const std::string trace = library_folder() + "/other_trace";
    Rig rig({host::Manner::strict(), "small"});
    write_file(dmp_path, GetParam().first_line + trace);
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u);
    EXPECT_EQ(!trace_file_words(trace).empty(), GetParam().is_written);
    rig.stop();
}

INSTANTIATE_TEST_SUITE_P(That, Log_Settings_File, testing::ValuesIn(log_settings),
                         [](const auto& info) { return "Is" + std::string(info.param.label); });

TEST(LogSettingsFile, ThatIsMissingMeansNoTrace)
{
    Rig rig({host::Manner::strict(), "small"});
    remove(dmp_path);
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u);
    EXPECT_THAT(rig.words(), IsEmpty());
    rig.stop();
    EXPECT_EQ(read_file(dmp_path), "0,0,0\n");
}

TEST(LogSettingsFile, OfAFolderOrAnUnreadableOneStopsNobody)
{
    Rig rig({host::Manner::strict(), "small"});
    remove(dmp_path);
    make_folder(dmp_path);
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u);
    rig.stop();
    remove(dmp_path);
}

TEST(LogSettingsFile, WithATraceThatCannotBeWrittenMeansNoTrace)
{
    for (const char* trace : {"/no/such/folder/trace", "/proc/version", "/etc", ""}) {
        Rig rig({host::Manner::strict(), "small"});
        write_file(dmp_path, std::string("2,5,1\n") + trace);
        EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u) << trace;
        EXPECT_THAT(rig.words(), IsEmpty()) << trace;
        rig.stop();
    }
}

// A FIFO that nobody reads, or a full device, must not hold a request.
TEST(LogSettingsFile, WithATraceThatBlocksMeansNoWaiting)
{
    const std::string fifo = library_folder() + "/fifo";
    ASSERT_EQ(mkfifo(fifo.c_str(), 0600), 0);
    for (const std::string& trace : {fifo, std::string("/dev/full")}) {
        Rig rig({host::Manner::strict(), "small"});
        write_file(dmp_path, "2,5,1\n" + trace);
        EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u) << trace;
        rig.stop();
    }
    remove(fifo);
}

// --- The address of the management interface
// -------------------------------------------------------------------------------

TEST(WebLaunchFile, ThatIsMissingIsTold)
{
    Rig rig({host::Manner::strict(), "small"});
    remove(smis_path);
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u);
    EXPECT_THAT(rig.enumerate("NVRHBA_RemoteServiceAccessPoint").instances, IsEmpty());
    EXPECT_THAT(rig.words(), Contains("WebLaunch config file '/etc/nvr_smis.conf' not found."));
}

TEST(WebLaunchFile, OfEveryShapeStopsNobody)
{
    for (const std::string& text :
         {std::string(), std::string("#\n\n \t\n"), std::string(3000, 'x'), std::string("\0\xff\n", 3),
          std::string("# comment\n\n  http://storage1:8080/launch  \n")}) {
        Rig rig({host::Manner::strict(), "small"});
        write_file(smis_path, text);
        EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u);
        EXPECT_THAT(rig.enumerate("NVRHBA_RemoteServiceAccessPoint"), succeeded());
        rig.stop();
        remove(smis_path);
    }
    make_link("/dev/zero", smis_path);
    Rig rig({host::Manner::strict(), "small"});
    EXPECT_THAT(rig.enumerate("NVRHBA_RemoteServiceAccessPoint").instances, IsEmpty());
    rig.stop();
    remove(smis_path);
}
