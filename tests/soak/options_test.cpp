#include "tests/soak/Options.h"

#include <stdexcept>
#include <string>
#include <vector>

#include <gmock/gmock.h>

using soak::Options;

namespace {

Options parsed(std::vector<std::string> words)
{
    words.insert(words.begin(), "nvr_soak");
    std::vector<char*> argv;
    for (std::string& word : words)
        argv.push_back(word.data());
    return Options::parsed(static_cast<int>(argv.size()), argv.data());
}

} // namespace

TEST(Options, OfNoWordsAreFiveMinutesOfManyLives)
{
    const Options options = parsed({});
    EXPECT_EQ(options.length, std::chrono::minutes(5));
    EXPECT_EQ(options.requests, 0u);
    EXPECT_FALSE(options.has_one_life);
}

TEST(Options, OneLifeStandsAnywhereAndTakesNoValue)
{
    for (const std::vector<std::string>& words :
         {std::vector<std::string>{"--one-life", "--minutes", "3"}, {"--minutes", "3", "--one-life"}}) {
        const Options options = parsed(words);
        EXPECT_TRUE(options.has_one_life);
        EXPECT_EQ(options.length, std::chrono::minutes(3));
    }
}

TEST(Options, ThatAreNotUnderstoodAreRefused)
{
    for (const std::vector<std::string>& words : {std::vector<std::string>{"--minutes"},
                                                  {"--minutes", "0"},
                                                  {"--minutes", "-3"},
                                                  {"--minutes", "3x"},
                                                  {"--one-life", "3"},
                                                  {"--manner", "nobody's"},
                                                  {"--lives", "1"}})
        EXPECT_THROW(parsed(words), std::invalid_argument) << words.front();
}
