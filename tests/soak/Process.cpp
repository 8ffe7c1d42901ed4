#include "tests/soak/Process.h"

#include <malloc.h>

#include "tests/support/process_state.h"

namespace soak {

Process Process::now()
{
    Process process;
    malloc_trim(0);
    process.resident = nvrtest::resident_kilobytes();
    process.heap = nvrtest::heap_bytes() / 1024;
    process.threads = nvrtest::number_of_threads();
    process.descriptors = nvrtest::open_files().size();
    return process;
}

} // namespace soak
