// Texts of World Wide Names and hardware addresses, and versions of firmware.
#include <cstring>

#include "foundation/NVR_Common.h"
#include "fuzz/fuzzing.h"

using namespace cimple;
using fuzzing::expect;

extern "C" int LLVMFuzzerInitialize(int*, char***)
{
    static fuzzing::Every_Line lines;
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string text(reinterpret_cast<const char*>(data), size);
    HBA_WWN plain{};
    if (string2HBAName(&plain, text.c_str()) == 1) {
        HBA_WWN again{};
        expect(string2HBAName(&again, wwnText(plain).c_str()) == 1, "a name's text is read again");
        expect(std::memcmp(&plain, &again, sizeof plain) == 0, "a name's text is the name");
    }
    HBA_WWN colons{};
    if (str2HBAName(&colons, text.c_str()) == 0) {
        HBA_WWN again{};
        expect(str2HBAName(&again, wwnColonText(colons).c_str()) == 0, "a name's text with colons is read again");
        expect(std::memcmp(&colons, &again, sizeof colons) == 0, "a name's text with colons is the name");
    }
    std::string name(hba_name_size, '\x7f');
    expect(Id2HBAName(name.data(), text.c_str()) == 0, "every identifier gets its colons");
    expect(name[23] == '\0', "an identifier with colons has its end");
    HBA_WWN identifier{};
    str2HBAName(&identifier, name.c_str());
    std::string address(mac_name_text_size, '\0');
    if (mac2HBAName(address.data(), text.c_str()) == 0)
        expect(std::strlen(address.c_str()) == 23, "an address becomes a name's length");
    NVR_Version version;
    parseVersion(text.c_str(), version);

    // What a device says of itself.
    fuzzing::Bytes bytes(data, size);
    DeviceIdentifier descriptor;
    descriptor.identifierLength = bytes.byte() & 0x80 ? bytes.number() : bytes.byte();
    bytes.fill(descriptor.identifier, sizeof descriptor.identifier);
    char printed[descriptor_text_size];
    printDescriptor(printed, descriptor);
    expect(std::strlen(printed) < sizeof printed, "a descriptor is printed with its end");
    return 0;
}
