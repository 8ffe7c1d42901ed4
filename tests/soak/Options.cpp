#include "tests/soak/Options.h"

#include <stdexcept>
#include <string>

namespace soak {

namespace {

constexpr char usage_text[] =
    "nvr_soak [--seconds N | --minutes N | --hours N | --requests N] [--clients N] [--manner NAME] [--seed N]\n"
    "         [--one-life]      the module is loaded once and unloaded at the end, the settings are the defaults,\n"
    "                           and what a client sets it sets back. First half: services have the adapters read\n"
    "                           anew; in every other stretch between two looks library calls fail, and each\n"
    "                           refresh reads the adapters, since a reading that failed would leave none for the\n"
    "                           rest of the life. Second half: library calls fail, and nothing has the adapters\n"
    "                           read anew: no changes of WWNs, firmware or resets, nor diagnostics, whose jobs and\n"
    "                           records stay until then. Memory is judged over the later part of each half\n"
    "         [--patience N]    seconds that a request may take; more where others keep the processors busy\n"
    "         [--leak BYTES]    each request loses so many bytes, in one life until the adapters are read anew:\n"
    "                           the run has to end with 1\n";

std::uint64_t number(const std::string& text)
{
    std::size_t read = 0;
    const std::uint64_t value = std::stoull(text, &read);
    if (read != text.size() || value == 0 || text[0] == '-') throw std::invalid_argument("no number: " + text);
    return value;
}

} // namespace

const char* Options::usage()
{
    return usage_text;
}

Options Options::parsed(int argc, char** argv)
{
    Options options;
    for (int i = 1; i < argc; i++) {
        const std::string name = argv[i];
        if (name == "--help") {
            options.asks_for_help = true;
            continue;
        }
        if (name == "--one-life") {
            options.has_one_life = true;
            continue;
        }
        if (++i == argc) throw std::invalid_argument(usage_text);
        const std::string value = argv[i];
        if (name == "--seconds")
            options.length = std::chrono::seconds(number(value));
        else if (name == "--minutes")
            options.length = std::chrono::minutes(number(value));
        else if (name == "--hours")
            options.length = std::chrono::hours(number(value));
        else if (name == "--requests")
            options.requests = number(value);
        else if (name == "--clients")
            options.clients = number(value);
        else if (name == "--seed")
            options.seed = number(value);
        else if (name == "--patience")
            options.patience = std::chrono::seconds(number(value));
        else if (name == "--leak")
            options.leak = number(value);
        else if (name == "--manner")
            options.manner = host::Manner::find(value);
        else
            throw std::invalid_argument(usage_text);
        if (!options.manner) throw std::invalid_argument("no such manner: " + value);
    }
    return options;
}

} // namespace soak
