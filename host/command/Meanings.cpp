#include "host/command/Meanings.h"

namespace host {
namespace {

/// Return values that services share.
const Meanings& shared()
{
    static const Meanings meanings = {
        {0, "done"},
        {1, "the library refused"},
        {4, "it was asked of the wrong service, or a file could not be written"},
        {5, "an option is none, or a file could not be looked at"},
        {91, "the name is that of a virtual port"},
        {4097, "something that is needed was not given"},
        {4107, "the file was not found"},
        {32767, "the adapter has no entries"},
        {32768, "there is no adapter, or it failed for a reason of its own"},
        {32774, "memory ran out"},
        {32968, "the port is unknown, or something that was given is not possible"},
        {32969, "a name is missing"},
        {33068, "it was asked of an instance that is not the host's service"},
    };
    return meanings;
}

/// Statuses of the management library, which services return with 40000 added.
const Meanings& statuses()
{
    static const Meanings meanings = {
        {1, "the port is not local, or the library does not have the call, or it failed"},
        {2, "not supported"},
        {3, "invalid handle"},
        {4, "invalid argument"},
        {5, "no World Wide Name that can be used"},
        {7, "more data available"},
        {8, "stale data"},
        {9, "SCSI check condition"},
        {27, "the directory cannot be opened"},
        {60, "no result yet"},
        {62, "too many requests"},
        {63, "diagnostics are not available"},
        {64, "the adapter is busy"},
        {89, "names of this type are not supported"},
        {92, "management of World Wide Names is not available"},
        {97, "management of World Wide Names is busy"},
        {128, "not supported on this host"},
        {148, "a command of the mailbox failed"},
        {149, "a command of the mailbox timed out"},
        {150, "the mailbox is busy"},
        {160, "the configuration cannot be opened"},
        {178, "the configuration cannot be written"},
        {190, "the reset was refused"},
        {191, "the list is too long"},
        {221, "boot code is enabled: disable it first"},
        {247, "the firmware is written, and a restart of the host activates it"},
    };
    return meanings;
}

constexpr std::uint64_t library_base = 40000;
constexpr std::uint64_t library_most = 49999;

} // namespace

std::string words_among(const Meanings& meanings, std::uint64_t value)
{
    for (const Meaning& meaning : meanings)
        if (meaning.value == value) return meaning.words;
    return "";
}

std::string words_of_bits(const Meanings& bits, std::uint64_t value)
{
    std::string words;
    for (const Meaning& bit : bits)
        if (value & bit.value) words += (words.empty() ? "" : ", ") + bit.words;
    return words;
}

std::string return_words(const Meanings& own, std::uint64_t value)
{
    std::string words = words_among(own, value);
    if (words.empty()) words = words_among(shared(), value);
    if (!words.empty()) return words;
    if (value <= library_base || value > library_most) return "a value without a meaning that is known";
    const std::uint64_t status = value - library_base;
    words = words_among(statuses(), status);
    return "the management library answered " + std::to_string(status) + (words.empty() ? "" : ": " + words);
}

} // namespace host
