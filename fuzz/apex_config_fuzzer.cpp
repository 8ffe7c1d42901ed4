// The file of a tag table.
#include <cstring>
#include <new>
#include <stdexcept>

#include "fuzz/fuzzing.h"
#include "services/ApexConfig.h"

using namespace cimple;
using fuzzing::expect;

extern "C" int LLVMFuzzerInitialize(int*, char***)
{
    static fuzzing::Every_Line lines;
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    try {
        const Tag_Table table = readApexConfig(std::string(reinterpret_cast<const char*>(data), size));
        const Tag_Table again = readApexConfig(apexConfigText(table, {"now", "host", "adapter"}));
        expect(again.size() == table.size(), "a table that was written has its length");
        for (uint32 i = 0; i < table.size(); i++)
            expect(std::memcmp(&again[i], &table[i], sizeof table[i]) == 0, "a table that was written reads the same");
    } catch (const std::runtime_error&) {
    } catch (const std::bad_alloc&) {
    }
    return 0;
}
