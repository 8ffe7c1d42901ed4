#include "simulator/Model.h"

#include <cctype>
#include <cstring>

namespace nvrsim {

Wwn to_number(const HBA_WWN& wwn)
{
    Wwn number = 0;
    for (HBA_UINT8 byte : wwn.wwn)
        number = number << 8 | byte;
    return number;
}

HBA_WWN to_wire(Wwn wwn)
{
    HBA_WWN wire;
    for (int i = 0; i < 8; ++i)
        wire.wwn[i] = static_cast<HBA_UINT8>(wwn >> (56 - 8 * i));
    return wire;
}

std::string to_text(Wwn wwn)
{
    static const char digits[] = "0123456789ABCDEF";
    std::string text(16, '0');
    for (int i = 0; i < 16; ++i)
        text[static_cast<size_t>(i)] = digits[wwn >> (60 - 4 * i) & 15];
    return text;
}

bool parse_wwn(const std::string& text, Wwn& wwn)
{
    size_t at = text.compare(0, 2, "0x") == 0 ? 2 : 0;
    Wwn number = 0;
    int digits = 0;
    for (; at < text.size(); ++at) {
        const char c = text[at];
        if (c == ':' || c == '-' || c == ' ') continue;
        if (!std::isxdigit(static_cast<unsigned char>(c)) || ++digits > 16) return false;
        number = number << 4 |
                 static_cast<unsigned>(c <= '9' ? c - '0' : std::toupper(static_cast<unsigned char>(c)) - 'A' + 10);
    }
    if (digits != 16) return false;
    wwn = number;
    return true;
}

Bytes encode32(uint32_t value)
{
    Bytes bytes(sizeof value, '\0');
    std::memcpy(&bytes[0], &value, sizeof value);
    return bytes;
}

Bytes encode64(uint64_t value)
{
    Bytes bytes(sizeof value, '\0');
    std::memcpy(&bytes[0], &value, sizeof value);
    return bytes;
}

const Lun* Target::find(uint64_t fcpLun) const
{
    const auto found = byFcpLun.find(fcpLun);
    return found == byFcpLun.end() ? nullptr : &luns[found->second];
}

const Target* Port::find_target(Wwn wwpn) const
{
    const auto found = targetByWwpn.find(wwpn);
    return found == targetByWwpn.end() ? nullptr : targets[found->second].get();
}

size_t Port::paths() const
{
    size_t count = 0;
    for (const auto& target : targets)
        count += target->luns.size();
    return count;
}

void Host::reindex()
{
    m_adapterByName.clear();
    m_portByWwpn.clear();
    m_portByOrdinal.clear();
    for (uint32_t a = 0; a < adapters.size(); ++a) {
        m_adapterByName.emplace(adapters[a].name, a);
        for (uint32_t p = 0; p < adapters[a].ports.size(); ++p) {
            m_portByOrdinal.emplace_back(a, p);
            if (adapters[a].present) m_portByWwpn.emplace(adapters[a].ports[p].current.wwpn, std::make_pair(a, p));
        }
    }
}

Adapter* Host::find(const std::string& adapterName)
{
    const auto found = m_adapterByName.find(adapterName);
    return found == m_adapterByName.end() ? nullptr : &adapters[found->second];
}

Port* Host::find(Wwn wwpn, Adapter** owner)
{
    const auto found = m_portByWwpn.find(wwpn);
    if (found == m_portByWwpn.end()) return nullptr;
    if (owner) *owner = &adapters[found->second.first];
    return &adapters[found->second.first].ports[found->second.second];
}

Port* Host::port(uint32_t ordinal, Adapter** owner)
{
    if (ordinal >= m_portByOrdinal.size()) return nullptr;
    const auto [a, p] = m_portByOrdinal[ordinal];
    if (owner) *owner = &adapters[a];
    return &adapters[a].ports[p];
}

} // namespace nvrsim
