#include "tests/foundation/fakes/fake_libraries.h"
#include "tests/support/private_host.h"

namespace fake {

void install(const std::vector<std::string>& libraries)
{
    const std::string folder = nvrtest::library_folder();
    // An empty file ends the loader's search; without it a library of the machine's own would be found.
    for (const char* name : {"HBAAPI", "lrmapi", "rmapi", "tssdm"})
        nvrtest::write_file(folder + "/lib" + name + ".so", "");
    for (const std::string& library : libraries) {
        const std::size_t equals = library.find('=');
        const std::string build = library.substr(0, equals);
        const std::string name = equals == std::string::npos ? library : library.substr(equals + 1);
        nvrtest::make_link(std::string(NVR_FAKE_LIBRARIES) + "/libfake_" + build + ".so",
                           folder + "/lib" + name + ".so");
    }
}

} // namespace fake
