/// A locale with a decimal comma for a scope, made here, since few systems have one installed.
///
/// Writes the numbers' part of a locale in the C library's own format into a folder of its own and makes it the
/// process's. One at a time, while no other thread runs.
#pragma once

#include <clocale>
#include <cstdint>
#include <cstdlib>
#include <fstream>
#include <gtest/gtest.h>
#include <string>
#include <sys/stat.h>
#include <unistd.h>

namespace cimple {

class Comma_Locale {
public:
    Comma_Locale()
    {
        char name[] = "/tmp/comma_locale_XXXXXX";
        m_folder = mkdtemp(name);
        mkdir((m_folder + "/comma").c_str(), 0777);
        write_numbers(m_folder + "/comma/LC_NUMERIC");
        setenv("LOCPATH", m_folder.c_str(), 1);
        EXPECT_NE(std::setlocale(LC_NUMERIC, "comma"), nullptr);
        EXPECT_STREQ(std::localeconv()->decimal_point, ",");
    }
    ~Comma_Locale()
    {
        std::setlocale(LC_NUMERIC, "C");
        unsetenv("LOCPATH");
        unlink((m_folder + "/comma/LC_NUMERIC").c_str());
        rmdir((m_folder + "/comma").c_str());
        rmdir(m_folder.c_str());
    }
    Comma_Locale(const Comma_Locale&) = delete;
    Comma_Locale& operator=(const Comma_Locale&) = delete;

private:
    // A magic number, the count of items, the place of each, and the items: decimal point, thousands separator,
    // grouping, the first two as wide characters, the character set.
    static void write_numbers(const std::string& path)
    {
        constexpr std::uint32_t first = (2 + 6) * sizeof(std::uint32_t);
        const std::uint32_t head[] = {
            0x20031115 ^ LC_NUMERIC, 6, first, first + 2, first + 2, first + 4, first + 8, first + 12};
        const char items[] = ",\0\0\0" // a comma, nothing, nothing
                             ",\0\0\0"
                             "\0\0\0\0"
                             "ANSI_X3.4-1968";
        std::ofstream file(path, std::ios::binary);
        file.write(reinterpret_cast<const char*>(head), sizeof(head));
        file.write(items, sizeof(items));
    }

    std::string m_folder;
};

} // namespace cimple
