/// The words of the module's log, for comparison in order.
///
///     EXPECT_THAT(trace_file_words("/tmp/trace"), contains_in_order({"Entering ...", "cleanExit"}));
///
/// For all words of a trace use testing::ElementsAre, for a missing one testing::Not(testing::Contains(...)).
#pragma once

#include <ios>
#include <ostream>
#include <string>
#include <vector>

#include <gmock/gmock.h>

namespace nvrtest {

struct Trace_Line {
    std::string thread; ///< as the line names it
    std::string words;
};

/// The messages of a trace file from that byte on, in order, with the thread that logged each. A message of several
/// lines is one.
std::vector<Trace_Line> trace_file_lines(const std::string& path, std::streamoff from = 0);

/// The messages of a trace file, in order, without thread, time, file and level. A message of several lines is one.
std::vector<std::string> trace_file_words(const std::string& path);

/// Matches a list of words that has these among its own, in this order; others may stand in between.
class Contains_In_Order {
public:
    using is_gtest_matcher = void;

    explicit Contains_In_Order(std::vector<std::string> wanted) : m_wanted(std::move(wanted)) {}

    bool MatchAndExplain(const std::vector<std::string>& words, std::ostream* explanation) const;
    void DescribeTo(std::ostream* os) const;
    void DescribeNegationTo(std::ostream* os) const;

private:
    std::vector<std::string> m_wanted;
};

inline testing::Matcher<const std::vector<std::string>&> contains_in_order(std::vector<std::string> wanted)
{
    return Contains_In_Order(std::move(wanted));
}

} // namespace nvrtest
