// Texts of date-times, and date-times of any number of microseconds.
#include <cstdlib>
#include <cstring>

#include "fuzz/fuzzing.h"
#include "runtime/Datetime.h"

using cimple::Datetime;
using fuzzing::expect;

extern "C" int LLVMFuzzerInitialize(int*, char***)
{
    setenv("TZ", "UTC", 1); // other zones have hours that no local time stands for
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string text(reinterpret_cast<const char*>(data), size);
    char printed[Datetime::text_size];
    Datetime read;
    if (read.set(text.c_str()) == 1) {
        read.pretty(printed);
        read.ascii(printed);
        if (std::strlen(printed) == 25) { // the 33rd of December 9999 is a day of the year 10000
            Datetime again;
            expect(again.set(printed) == 1, "a date-time that was read prints as one");
            expect(again == read, "a date-time that was read prints as itself");
        }
    } else {
        expect(read == Datetime(), "a text that is refused changes nothing");
    }

    fuzzing::Bytes bytes(data, size);
    const std::uint64_t usec = bytes.wide();
    Datetime any(usec);
    any.ascii(printed);
    expect(std::strlen(printed) < sizeof printed, "an interval is printed with its end");
    any.set_timestamp(usec, static_cast<cimple::sint32>(bytes.number()));
    any.ascii(printed);
    any.pretty(printed);
    expect(std::strlen(printed) < sizeof printed, "a timestamp is printed with its end");
    return 0;
}
