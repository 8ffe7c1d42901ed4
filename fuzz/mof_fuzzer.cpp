// The text of MOF files, up to classes with resolved inheritance, as the host takes them.
#include "fuzz/fuzzing.h"
#include "host/Schema.h"
#include "mof/Repository.h"

using fuzzing::expect;

extern "C" int LLVMFuzzerInitialize(int*, char***)
{
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string text(reinterpret_cast<const char*>(data), size);
    if (text.find("include") != std::string::npos) return 0; // files of this machine are no part of the input
    mof::Repository repository;
    const bool read = repository.read_text("input.mof", text);
    const bool resolved = repository.resolve();
    expect((read && resolved) == repository.faults().empty(), "whatever is refused has a reason");
    std::string error;
    const auto schema = host::Schema::from_text(text, error);
    expect(bool(schema) == error.empty(), "a schema or an error");
    return 0;
}
