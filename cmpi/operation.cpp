#include "cmpi/operation.h"

namespace cimple {

void log_enter(const char* label)
{
    CIMPLE_DBG("enter: %s()", label);
}

void log_return(const char* label)
{
    CIMPLE_DBG("return: %s()", label);
}

void log_return(const char* label, const Outcome& outcome)
{
    if (outcome.word)
        CIMPLE_DBG("return: %s(): %s %s", label, code_name(outcome.logged), outcome.word);
    else
        CIMPLE_DBG("return: %s(): %s", label, code_name(outcome.logged));
}

} // namespace cimple
