#include "agent/Driver_Log_Store.h"

#include <utility>

#include "foundation/CLogger.h"

namespace cimple {

int Driver_Log_Store::insert(std::string line)
{
    if (line.empty()) return 0;
    NVR_LOG("Handlelog ---  Prior to Inserting into DeviceLog Vector");
    if (lines.size() >= capacity) return 1;
    lines.push_back(std::move(line));
    index++;
    return 0;
}

void Driver_Log_Store::clear()
{
    std::vector<std::string>().swap(lines); // a cleared log holds no memory
    index = -1;
}

} // namespace cimple
