#include "tests/cmpi/Bridge_Test.h"

#include <cstdlib>
#include <filesystem>
#include <fstream>

namespace cimple {

Runtime_Log::Runtime_Log()
{
    char folder[] = "/tmp/cmpi_test_XXXXXX";
    m_folder = mkdtemp(folder);
    std::ofstream(m_folder + "/.cimplerc") << "LOG_LEVEL=DBG\n";
    setenv("CIMPLE_HOME", m_folder.c_str(), 1);
}

Runtime_Log::~Runtime_Log()
{
    std::error_code ignored;
    std::filesystem::remove_all(m_folder, ignored);
}

// "<date> <time> LEVEL: file(line): message"
static std::string without_time_and_place(const std::string& line)
{
    const std::size_t level = line.find(' ', line.find(' ') + 1) + 1;
    const std::size_t level_end = line.find(": ", level);
    const std::size_t place_end = line.find("): ", level_end);
    if (place_end == std::string::npos) return line;
    return line.substr(level, level_end - level) + " " + line.substr(place_end + 3);
}

std::vector<std::string> Runtime_Log::lines() const
{
    std::ifstream file(m_folder + "/.cimple/messages");
    std::vector<std::string> lines;
    for (std::string line; std::getline(file, line);)
        lines.push_back(without_time_and_place(line));
    return lines;
}

bool Runtime_Log::has(const std::string& wanted) const
{
    for (const std::string& line : lines())
        if (line == wanted) return true;
    return false;
}

Bridge_Test::~Bridge_Test()
{
    while (tables.adapter)
        clean(true);
    EXPECT_EQ(provider.created, provider.destroyed);
    EXPECT_EQ(broker.alive(), elements_left);
    EXPECT_THAT(broker.faults, testing::IsEmpty());
}

void* Bridge_Test::create(char kind)
{
    void* mi = nullptr;
    EXPECT_EQ(cimple_cmpi_adapter('C', &tables, &provider, &broker.cmpi, context, provider.provider_name, kind, &mi),
              0);
    return mi;
}

CMPIrc Bridge_Test::clean(bool terminating)
{
    CMPIInstanceMI mi{&tables, &tables.instance_table};
    return tables.instance_table.cleanup(&mi, context, terminating).rc;
}

} // namespace cimple
