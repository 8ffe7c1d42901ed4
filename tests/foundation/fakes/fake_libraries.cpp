#include "tests/foundation/fakes/fake_libraries.h"

namespace fake {

#define NVR_VISIBLE __attribute__((visibility("default")))

NVR_VISIBLE Operations& operations()
{
    static Operations operations;
    return operations;
}

NVR_VISIBLE std::vector<std::string>& calls()
{
    static std::vector<std::string> calls;
    return calls;
}

NVR_VISIBLE void record_call(const char* call)
{
    calls().push_back(call);
}

} // namespace fake
