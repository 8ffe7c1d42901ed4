#include "tests/foundation/fakes/fake_libraries.h"

#include <mutex>

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
    static std::mutex mutex;
    std::lock_guard<std::mutex> lock(mutex);
    calls().push_back(call);
}

} // namespace fake
