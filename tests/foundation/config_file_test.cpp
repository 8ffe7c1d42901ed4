#include "foundation/NvrConfigFile.h"

#include <atomic>
#include <cerrno>
#include <thread>

#include <gmock/gmock.h>
#include <sys/stat.h>

#include "tests/support/log_capture.h"
#include "tests/support/private_host.h"

using namespace cimple;
using namespace nvrtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace {

const std::string path = "/etc/norvane_fc_provider.conf";

struct ConfigFile : testing::Test {
    void load(const std::string& content)
    {
        write_file(path, content);
        errno = 0;
        config.load(provider_config_path);
    }
    void expect(uint32 timeout, bool adapterData, bool sanData) const
    {
        EXPECT_EQ(config.getCacheTimeout(), timeout);
        EXPECT_EQ(config.getRefreshAdapterData(), adapterData);
        EXPECT_EQ(config.getRefreshSANData(), sanData);
    }
    NvrConfigFile config;
};

std::string written(int timeout, const char* adapterData, const char* sanData)
{
    return std::string("##################################################\n"
                       "# Norvane HBA CIM Provider Configuration Settings #\n"
                       "##################################################\n"
                       "NVR_PROVIDER_CACHE_TIMEOUT = ") +
           std::to_string(timeout) + "\nNVR_PROVIDER_REFRESH_ADAPTERDATA = " + adapterData +
           "\nNVR_PROVIDER_REFRESH_SANDATA = " + sanData + "\n";
}

} // namespace

TEST_F(ConfigFile, ThatIsMissingLeavesTheDefaults)
{
    Log_Capture log;
    errno = 0;
    config.load(provider_config_path);
    expect(10, false, true);
    EXPECT_THAT(log.words(), IsEmpty());
}

TEST_F(ConfigFile, SetsTheThreeValues)
{
    load("NVR_PROVIDER_CACHE_TIMEOUT = 20\nNVR_PROVIDER_REFRESH_ADAPTERDATA = TRUE\n"
         "NVR_PROVIDER_REFRESH_SANDATA = FALSE\n");
    expect(20, true, false);
}

TEST_F(ConfigFile, TakesWhiteSpaceAndComments)
{
    load("  # NVR_PROVIDER_CACHE_TIMEOUT = 5\n\n\t NVR_PROVIDER_CACHE_TIMEOUT\t=20 \r\n"
         "NVR_PROVIDER_REFRESH_ADAPTERDATA=TRUE");
    expect(20, true, true);
}

TEST_F(ConfigFile, TakesTheFirstValidLineOfAKey)
{
    load("NVR_PROVIDER_CACHE_TIMEOUT = 31\nNVR_PROVIDER_CACHE_TIMEOUT = 20\nNVR_PROVIDER_CACHE_TIMEOUT = 5\n"
         "NVR_PROVIDER_REFRESH_SANDATA = false\nNVR_PROVIDER_REFRESH_SANDATA = FALSE\n"
         "NVR_PROVIDER_REFRESH_SANDATA = TRUE\n"
         "NVR_PROVIDER_REFRESH_ADAPTERDATA = yes\nNVR_PROVIDER_REFRESH_ADAPTERDATA = TRUE\n"
         "NVR_PROVIDER_REFRESH_ADAPTERDATA = FALSE\n");
    expect(20, true, false);
}

TEST_F(ConfigFile, TakesTimeoutsFromOneToThirty)
{
    for (const char* valid : {"1", "30", "007", "+5", "20 minutes", "12=13"}) {
        NvrConfigFile fresh;
        write_file(path, std::string("NVR_PROVIDER_CACHE_TIMEOUT = ") + valid);
        errno = 0;
        fresh.load(path.c_str());
        EXPECT_NE(fresh.getCacheTimeout(), 10u) << valid;
    }
    for (const char* invalid : {"0", "31", "-1", "", "ten", "0x10", "4294967297", "99999999999999999999999", "= 5"}) {
        NvrConfigFile fresh;
        write_file(path, std::string("NVR_PROVIDER_CACHE_TIMEOUT = ") + invalid);
        errno = 0;
        fresh.load(path.c_str());
        EXPECT_EQ(fresh.getCacheTimeout(), 10u) << invalid;
    }
}

TEST_F(ConfigFile, TakesFlagsInCapitalsOnly)
{
    for (const char* invalid : {"true", "True", "1", "", "TRUEE", "TRU", "FALSE FALSE", "FALSE;"}) {
        load(std::string("NVR_PROVIDER_REFRESH_ADAPTERDATA = ") + invalid +
             "\nNVR_PROVIDER_REFRESH_SANDATA = " + invalid + "\n");
        expect(10, false, true);
    }
}

TEST_F(ConfigFile, ComparesKeysWithCase)
{
    load("nvr_provider_cache_timeout = 5\nNVR_PROVIDER_CACHE_TIMEOUTS = 6\nNVR_PROVIDER_CACHE = 7\n= 8\n=\n5\n");
    expect(10, false, true);
}

TEST_F(ConfigFile, IsReadAThousandLinesFar)
{
    std::string filler;
    for (int i = 0; i < 999; i++)
        filler += "#\n";
    load(filler + "NVR_PROVIDER_REFRESH_ADAPTERDATA = TRUE\nNVR_PROVIDER_CACHE_TIMEOUT = 20\n");
    expect(10, true, true);
}

TEST_F(ConfigFile, CutsLinesAt1023Characters)
{
    load("#" + std::string(1022, 'x') + "NVR_PROVIDER_CACHE_TIMEOUT = 20\n");
    expect(20, false, true);
}

TEST_F(ConfigFile, OfRubbishLeavesTheDefaults)
{
    std::string rubbish;
    for (int i = 0; i < 100000; i++)
        rubbish += static_cast<char>(i * 7919 >> 5);
    load(rubbish);
    expect(10, false, true);
    load(std::string("NVR_PROVIDER_CACHE_TIMEOUT\0 = 20", 32));
    expect(10, false, true);
}

TEST_F(ConfigFile, IsNotReadWhenErrnoIsStale)
{
    write_file(path, "NVR_PROVIDER_CACHE_TIMEOUT = 20\n");
    Log_Capture log;
    errno = ENOENT;
    config.load(provider_config_path);
    expect(10, false, true);
    EXPECT_THAT(log.words(), IsEmpty());
    errno = EINVAL;
    config.load(provider_config_path);
    expect(20, false, true);
}

TEST_F(ConfigFile, ThatCannotBeOpenedIsLogged)
{
    write_file(path, "");
    make_unopenable(path);
    Log_Capture log;
    errno = 0;
    config.load(provider_config_path);
    EXPECT_THAT(log.words(),
                ElementsAre("Unable to open provider config setting file - /etc/norvane_fc_provider.conf"));
}

TEST_F(ConfigFile, ThatIsAFolderOrAFifoIsHarmless)
{
    make_folder(path);
    errno = 0;
    config.load(provider_config_path);
    config.save();
    remove(path);
    ASSERT_EQ(::mkfifo(path.c_str(), 0600), 0);
    errno = 0;
    config.load(provider_config_path);
    config.save();
    expect(10, false, true);
}

TEST_F(ConfigFile, IsSavedInSixLines)
{
    load("# a comment of the administrator\nNVR_PROVIDER_CACHE_TIMEOUT = 7\n");
    EXPECT_EQ(config.setRefreshAdapterData(1), 0);
    EXPECT_EQ(config.setRefreshSANData(0), 0);
    config.save();
    EXPECT_EQ(read_file(path), written(7, "TRUE", "FALSE"));
}

TEST(ConfigFileEnd, LeavesAFileAloneThatWasSavedForGood)
{
    {
        NvrConfigFile config;
        errno = 0;
        config.load(provider_config_path);
        EXPECT_EQ(config.setCacheTimeout(30), 0);
        config.saveForGood();
        EXPECT_EQ(read_file(path), written(30, "FALSE", "TRUE"));
        write_file(path, "another's");
        config.saveForGood();
    }
    EXPECT_EQ(read_file(path), "another's");
    remove(path);
}

TEST(ConfigFileEnd, SavesAlsoWhereNoFileWas)
{
    {
        NvrConfigFile config;
        errno = 0;
        config.load(provider_config_path);
        EXPECT_EQ(config.setCacheTimeout(30), 0);
        EXPECT_FALSE(exists(path));
    }
    EXPECT_EQ(read_file(path), written(30, "FALSE", "TRUE"));
    {
        NvrConfigFile config;
        errno = 0;
        config.load(provider_config_path);
        EXPECT_EQ(config.getCacheTimeout(), 30u);
    }
}

TEST(ConfigFileEnd, KeepsAFileThatCouldNotBeRead)
{
    const std::string kept = written(7, "TRUE", "FALSE");
    write_file(path, kept);
    const auto load_without_descriptors = [](NvrConfigFile& config) {
        const No_Descriptors none;
        errno = 0;
        config.load(provider_config_path);
    };
    {
        NvrConfigFile config;
        load_without_descriptors(config);
        EXPECT_EQ(config.getCacheTimeout(), 10u);
    }
    EXPECT_EQ(read_file(path), kept);
    {
        NvrConfigFile config;
        load_without_descriptors(config);
        EXPECT_EQ(config.setCacheTimeout(31), -1);
    }
    EXPECT_EQ(read_file(path), kept);
    {
        NvrConfigFile config;
        load_without_descriptors(config);
        EXPECT_EQ(config.setCacheTimeout(30), 0) << "a client wants this one";
    }
    EXPECT_EQ(read_file(path), written(30, "FALSE", "TRUE"));
}

TEST(ConfigFileEnd, WithoutALoadWritesNothing)
{
    {
        NvrConfigFile config;
    }
    EXPECT_FALSE(exists(path));
}

TEST_F(ConfigFile, RefusesValuesOutOfRange)
{
    for (uint32 minutes : {0u, 31u, 0xFFFFFFFFu})
        EXPECT_EQ(config.setCacheTimeout(minutes), -1);
    for (uint32 flag : {2u, 0xFFFFFFFFu}) {
        EXPECT_EQ(config.setRefreshAdapterData(flag), -1);
        EXPECT_EQ(config.setRefreshSANData(flag), -1);
    }
    expect(10, false, true);
    EXPECT_EQ(config.setCacheTimeout(1), 0);
    EXPECT_EQ(config.setRefreshAdapterData(1), 0);
    EXPECT_EQ(config.setRefreshAdapterData(0), 0);
    EXPECT_EQ(config.setRefreshSANData(0), 0);
    EXPECT_EQ(config.setRefreshSANData(1), 0);
    expect(1, false, true);
}

TEST_F(ConfigFile, IsUsedByManyThreads)
{
    std::thread setter([&] {
        for (uint32 i = 0; i < 1000; i++) {
            config.setCacheTimeout(1 + i % 30);
            config.setRefreshAdapterData(i % 2);
            config.setRefreshSANData(i % 2);
        }
    });
    for (int i = 0; i < 1000; i++) {
        const uint32 minutes = config.getCacheTimeout();
        EXPECT_TRUE(minutes >= 1 && minutes <= 30);
        config.getRefreshAdapterData();
        config.getRefreshSANData();
    }
    setter.join();
}

TEST(WebLaunchUrl, IsTheFirstLineThatSaysSomething)
{
    write_file("/etc/nvr_smis.conf", "# a comment\n\n   \t \n  # another\n  name  \nsecond\n");
    EXPECT_EQ(readWebLaunchURL(), "name  ");
    write_file("/etc/nvr_smis.conf", "https://host:8443/x?a=b#c");
    EXPECT_EQ(readWebLaunchURL(), "https://host:8443/x?a=b#c");
    write_file("/etc/nvr_smis.conf", std::string(300, 'u') + "\n");
    EXPECT_EQ(readWebLaunchURL(), std::string(255, 'u'));
}

TEST(WebLaunchUrl, MayFollowALongComment)
{
    write_file("/etc/nvr_smis.conf", "#" + std::string(1000, 'x') + "\nname\n");
    EXPECT_EQ(readWebLaunchURL(), "name");
}

TEST(WebLaunchUrl, IsEmptyWhereThereIsNone)
{
    Log_Capture log;
    EXPECT_EQ(readWebLaunchURL(), "");
    EXPECT_THAT(log.words(), ElementsAre("WebLaunch config file '/etc/nvr_smis.conf' not found."));
    for (const char* content : {"", "\n\n", "# only\n#comments", "   "}) {
        write_file("/etc/nvr_smis.conf", content);
        EXPECT_EQ(readWebLaunchURL(), "");
    }
    EXPECT_EQ(log.words().size(), 1u);
}
