// main() of the fuzz targets where there is no libFuzzer: runs each file of the folders that it is given, and then so
// many variations of each that are the same in every run.
//
//   <target> [--variations N] FOLDER...

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <random>
#include <vector>

#include "fuzz/fuzzing.h"

namespace {

using Input = std::vector<std::uint8_t>;

void run(const Input& input)
{
    // A copy of exactly this size, so that the sanitizer sees a step behind its end.
    std::vector<std::uint8_t> exact(input.begin(), input.end());
    exact.shrink_to_fit();
    LLVMFuzzerTestOneInput(exact.data(), exact.size());
}

std::vector<Input> read(const std::string& folder)
{
    std::vector<std::filesystem::path> files(std::filesystem::directory_iterator{folder}, {});
    std::sort(files.begin(), files.end());
    std::vector<Input> inputs;
    for (const std::filesystem::path& path : files) {
        std::ifstream file(path, std::ios::binary);
        inputs.emplace_back(std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>());
    }
    return inputs;
}

/// One to four small changes: a bit, a byte, a piece away, doubled, or out of another input.
void vary(Input& input, const std::vector<Input>& others, std::mt19937& random)
{
    const auto below = [&](std::size_t end) { return end == 0 ? 0 : random() % end; };
    for (std::size_t changes = 1 + below(4); changes > 0; changes--) {
        const std::size_t at = below(input.size());
        const std::size_t length = std::min(input.size() - at, 1 + below(16));
        const auto place = input.begin() + static_cast<std::ptrdiff_t>(at);
        const auto end = place + static_cast<std::ptrdiff_t>(length);
        switch (input.empty() ? 4 : below(6)) {
        case 0:
            *place ^= static_cast<std::uint8_t>(1u << below(8));
            break;
        case 1:
            *place = static_cast<std::uint8_t>(random());
            break;
        case 2:
            input.erase(place, end);
            break;
        case 3: {
            const Input piece(place, end);
            input.insert(place, piece.begin(), piece.end());
            break;
        }
        case 4: {
            const Input& other = others[below(others.size())];
            const std::size_t from = below(other.size());
            const std::size_t size = std::min(other.size() - from, 1 + below(64));
            const auto start = other.begin() + static_cast<std::ptrdiff_t>(from);
            input.insert(input.begin() + static_cast<std::ptrdiff_t>(at), start,
                         start + static_cast<std::ptrdiff_t>(size));
            break;
        }
        default:
            input.resize(at);
        }
    }
}

} // namespace

int main(int argc, char** argv)
{
    LLVMFuzzerInitialize(&argc, &argv);
    unsigned long variations = 0;
    std::vector<Input> inputs;
    for (int i = 1; i < argc; i++) {
        if (std::strcmp(argv[i], "--variations") == 0 && i + 1 < argc) {
            variations = std::strtoul(argv[++i], nullptr, 10);
            continue;
        }
        for (Input& input : read(argv[i]))
            inputs.push_back(std::move(input));
    }
    if (inputs.empty()) {
        std::fprintf(stderr, "usage: %s [--variations N] FOLDER...\n", argv[0]);
        return 2;
    }
    run({});
    std::mt19937 random; // of the fixed seed
    for (const Input& input : inputs) {
        run(input);
        for (unsigned long i = 0; i < variations; i++) {
            Input changed = input;
            vary(changed, inputs, random);
            run(changed);
        }
    }
    std::printf("%zu inputs, %lu variations of each\n", inputs.size(), variations);
}
