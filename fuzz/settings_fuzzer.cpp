// The provider's settings file, and the file with the web launcher's address.
#include <cerrno>
#include <cstring>

#include "foundation/NvrConfigFile.h"
#include "fuzz/fuzzing.h"
#include "tests/support/private_host.h"
#include "tests/support/private_host_setup.h"

using namespace cimple;
using fuzzing::expect;

extern "C" int LLVMFuzzerInitialize(int*, char*** argv)
{
    nvrtest::enter_private_host(*argv);
    static fuzzing::Every_Line lines;
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string text(reinterpret_cast<const char*>(data), size);
    nvrtest::write_file(provider_config_path, text);
    errno = 0;
    NvrConfigFile settings;
    settings.load(provider_config_path);
    expect(settings.getCacheTimeout() >= 1 && settings.getCacheTimeout() <= 30, "the time-out keeps to its range");
    settings.save();
    errno = 0;
    NvrConfigFile again;
    again.load(provider_config_path);
    expect(again.getCacheTimeout() == settings.getCacheTimeout() &&
               again.getRefreshAdapterData() == settings.getRefreshAdapterData() &&
               again.getRefreshSANData() == settings.getRefreshSANData(),
           "settings that were saved are loaded");

    nvrtest::write_file("/etc/nvr_smis.conf", text);
    const std::string url = readWebLaunchURL();
    expect(url.size() < 256 && url.find('\n') == std::string::npos, "an address is one line");
    return 0;
}
