// What the settings files are held against: none of what can be lost of them passes.
#include <string>

#include <gmock/gmock.h>

#include "tests/faults/Settings_Files.h"
#include "tests/module/support/Rig.h"
#include "tests/support/private_host.h"

using namespace nvrtest;
using testing::AllOf;
using testing::HasSubstr;

namespace {

// As the module writes it.
void write_conf(unsigned minutes)
{
    write_file(conf_path, "##################################################\n"
                          "# Norvane HBA CIM Provider Configuration Settings #\n"
                          "##################################################\n"
                          "NVR_PROVIDER_CACHE_TIMEOUT = " +
                              std::to_string(minutes) +
                              "\nNVR_PROVIDER_REFRESH_ADAPTERDATA = TRUE\nNVR_PROVIDER_REFRESH_SANDATA = TRUE\n");
}

void write_dmp(const std::string& first_line)
{
    write_file(dmp_path, first_line + '\n' + trace_path);
}

} // namespace

TEST(SettingsFiles, MayBeUnwrittenOnlyWhereThatIsSaid)
{
    const Settings_Files files(20);
    EXPECT_THAT(files.wrong(), AllOf(HasSubstr(conf_path), HasSubstr(dmp_path)));
    EXPECT_EQ(files.wrong(true), "");
    write_conf(20);
    write_dmp("2,5,1");
    EXPECT_EQ(files.wrong(), "");
}

TEST(SettingsFiles, AreMissedWhereTheyAreEmptyOrGone)
{
    const Settings_Files files(20);
    write_dmp("2,5,1");
    write_file(conf_path, "");
    EXPECT_THAT(files.wrong(true), HasSubstr("norvane_fc_provider.conf loses"));
    remove(conf_path);
    EXPECT_THAT(files.wrong(true), HasSubstr("norvane_fc_provider.conf loses"));
    write_conf(20);
    write_file(dmp_path, "");
    EXPECT_THAT(files.wrong(true), HasSubstr("norvane_fc_provider.dmp loses"));
    remove(dmp_path);
    EXPECT_THAT(files.wrong(true), HasSubstr("norvane_fc_provider.dmp loses"));
}

TEST(SettingsFiles, HoldWhatWasToldAndPerhapsWhatFailed)
{
    Settings_Files files(20);
    write_dmp("2,5,1");
    files.note_time_out(7, true);
    write_conf(20);
    EXPECT_NE(files.wrong(), "") << "it was told to be 7";
    files.note_time_out(30, false);
    for (const unsigned minutes : {7, 30}) {
        write_conf(minutes);
        EXPECT_EQ(files.wrong(), "") << minutes;
    }
    write_conf(10);
    EXPECT_NE(files.wrong(), "") << "nobody has set the default";
    write_conf(7);
    files.note_log_state(false, true);
    EXPECT_NE(files.wrong(), "");
    write_dmp("2,5,0");
    EXPECT_EQ(files.wrong(), "");
}
