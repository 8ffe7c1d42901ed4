// Vital product data: what a library hands out of a block of any content, and entries that lie.
#include "agent/vpd.h"
#include "fuzz/Spoiled_Host.h"
#include "tests/foundation/fakes/fake_libraries.h"

using namespace cimple;
using fuzzing::Bytes;
using fuzzing::expect;

static Bytes* entries = nullptr;

/// An entry as the input has it: whether there is one, the cursor, and a value that may fill its buffer.
static std::uint32_t entry_of_input(const void*, RM_VPDCURSOR* cursor, std::uint32_t, char* value, std::uint32_t size)
{
    if (entries->empty()) return 0;
    const std::uint32_t result = entries->byte() & 1;
    const std::uint8_t before = cursor->index;
    entries->fill(cursor, sizeof *cursor);
    if (entries->byte() & 1) cursor->index = static_cast<std::uint8_t>(before + 1);
    const std::string text =
        entries->short_text() + (entries->byte() & 1 ? std::string(size, 'x') : std::string(1, '\0'));
    text.copy(value, size);
    return result;
}

extern "C" int LLVMFuzzerInitialize(int*, char*** argv)
{
    fuzzing::make_spoiled_host(*argv, "[[adapter]]\n");
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    auto& library = fake::operations();
    const auto walk = library.RM_GetNextVpdEntry;
    Bytes input(data, size);
    const bool lies = input.byte() & 1;
    if (lies) library.RM_GetNextVpdEntry = &entry_of_input;
    entries = &input;
    library.RM_GetVPD = [&](HBA_WWN, void* block, std::uint32_t* room) -> std::uint32_t {
        if (!lies) input.fill(block, *room);
        return RM_STATUS_OK;
    };
    std::vector<Vpd_Entry> read;
    readVPD({}, read);
    expect(read.size() <= RM_VPD_MAX_ENTRIES, "a walk ends");
    for (const Vpd_Entry& entry : read)
        expect(entry.first.size() <= 2 && entry.second.size() <= RM_VPD_VALUE_SIZE, "tag and value fit their fields");
    library.RM_GetNextVpdEntry = walk;
    library.RM_GetVPD = nullptr;
    fuzzing::spoil_by(nullptr);
    return 0;
}
