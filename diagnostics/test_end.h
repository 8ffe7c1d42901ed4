/// How the tests end: with a job and its records, or with neither.
#pragma once

#include <cstddef>

#include "foundation/management_api.h"
#include "runtime/Type.h"

namespace cimple {

struct Diagnostic_Run;

/// What is cut to the size of a result text.
class Result_Text {
public:
    void format(const char* format, ...) __attribute__((format(printf, 2, 3)));
    const char* c_str() const { return m_text; }

private:
    char m_text[512] = {};
};

struct Test_Outcome {
    uint32 jobCode;
    uint32 recordStatus;
    uint32 testId;
    const char* text;
    const RM_DIAGRESULT* result = nullptr; // null: the adapter counted nothing
};

/// The test's name.
const char* name_of(const Diagnostic_Run& run);

/// Makes the job and its records; the run gets its copy of the job, unless the job is to go at once.
void leaveRecords(Diagnostic_Run& run, const Test_Outcome& outcome);

/// Leaves neither and says so. Result `status`.
uint32 leaveNothing(Diagnostic_Run& run, uint32 status);

} // namespace cimple
