#include "simulator/Blocks.h"

#include <algorithm>
#include <cstring>

namespace nvrsim {

namespace {

size_t padded(size_t length)
{
    return (length + 3) / 4 * 4;
}

uint32_t check_word(const RM_BLOCKHEADER& header)
{
    return header.magic ^ header.length ^ header.count ^ RM_BLOCK_CHECK;
}

} // namespace

Bytes build_block(const Attributes& attributes)
{
    RM_BLOCKHEADER header{RM_BLOCK_MAGIC, 0, 0, 0};
    Bytes block(sizeof header, '\0');
    for (const auto& [number, value] : attributes) {
        if (!value) continue;
        const RM_ATTRIBUTE record{number, static_cast<uint16_t>(value->size())};
        block.append(reinterpret_cast<const char*>(&record), sizeof record);
        block += *value;
        block.append(padded(value->size()) - value->size(), '\0');
        ++header.count;
    }
    header.length = static_cast<uint32_t>(block.size());
    header.check = check_word(header);
    std::memcpy(&block[0], &header, sizeof header);
    return block;
}

void* find_attribute(void* block, uint16_t number, uint16_t& length)
{
    RM_BLOCKHEADER header;
    std::memcpy(&header, block, sizeof header);
    if (header.magic != RM_BLOCK_MAGIC || header.check != check_word(header)) return nullptr;
    auto* bytes = static_cast<uint8_t*>(block);
    for (size_t at = sizeof header; at + sizeof(RM_ATTRIBUTE) <= header.length;) {
        RM_ATTRIBUTE record;
        std::memcpy(&record, bytes + at, sizeof record);
        at += sizeof record;
        if (record.length > header.length - at) return nullptr;
        if (record.number == number) {
            length = record.length;
            return bytes + at;
        }
        at += padded(record.length);
    }
    return nullptr;
}

bool vpd_entry(const uint8_t* data, size_t size, uint32_t index, std::string& tag, std::string& value)
{
    const auto is_wanted = [&index] { return index-- == 0; };
    for (size_t at = 0; at + 3 <= size;) {
        const uint8_t kind = data[at];
        if (kind != 0x82 && kind != 0x90 && kind != 0x91) return false; // the end tag, or nothing that we know
        const size_t length = std::min<size_t>(data[at + 1] | data[at + 2] << 8, size - at - 3);
        at += 3;
        const size_t end = at + length;
        if (kind == 0x82) {
            if (is_wanted()) {
                tag.assign(2, static_cast<char>(RM_VPD_TAG_PRODUCT_NAME));
                value.assign(data + at, data + end);
                return true;
            }
            at = end;
            continue;
        }
        while (at + 3 <= end) {
            const size_t width = std::min<size_t>(data[at + 2], end - at - 3);
            if (is_wanted()) {
                tag.assign(data + at, data + at + 2);
                value.assign(data + at + 3, data + at + 3 + width);
                return true;
            }
            at += 3 + width;
        }
        at = end;
    }
    return false;
}

} // namespace nvrsim
