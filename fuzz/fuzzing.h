/// What the fuzz targets share: reading an input piece by piece, a promise that ends the process when it is broken, and
/// a logger that takes everything, so that the texts of log lines are made as well.
///
/// A target is a file `<name>_fuzzer.cpp` with LLVMFuzzerTestOneInput and LLVMFuzzerInitialize. It is linked with
/// libFuzzer (preset `fuzz`) or with replay_main.cpp (preset `asan`). One thread.
#pragma once

#include <cstdint>
#include <string>

#include "foundation/NVR_LoggerInterface.h"

extern "C" int LLVMFuzzerInitialize(int* argc, char*** argv);
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);

namespace fuzzing {

/// The bytes of an input, in order. Behind the end come zeros.
class Bytes {
public:
    Bytes(const std::uint8_t* data, std::size_t size) : m_at(data), m_end(data + size) {}

    bool empty() const { return m_at == m_end; }
    std::uint8_t byte() { return empty() ? 0 : *m_at++; }
    std::uint16_t word() { return static_cast<std::uint16_t>(byte() << 8 | byte()); }
    std::uint32_t number() { return std::uint32_t{word()} << 16 | word(); }
    std::uint64_t wide() { return std::uint64_t{number()} << 32 | number(); }
    /// At most `most` bytes.
    std::string text(std::size_t most);
    /// A length byte and so many bytes.
    std::string short_text() { return text(byte()); }
    std::string rest() { return text(static_cast<std::size_t>(m_end - m_at)); }
    /// Fills at most `size` bytes at `place`; what the input has no more of stays.
    void fill(void* place, std::size_t size);

private:
    const std::uint8_t* m_at;
    const std::uint8_t* m_end;
};

/// Ends the process with these words where a promise of the code under test is broken.
void expect(bool kept, const char* promise);

/// Records nothing, but wants every level.
class Every_Line : public cimple::NVR_LoggerInterface {
public:
    Every_Line();
    ~Every_Line() override;
    void logMessage(cimple::sint32, const char*, cimple::uint32, const char*) override {}
    void open() override {}
    void close() override {}
    void clear() override {}
};

} // namespace fuzzing
