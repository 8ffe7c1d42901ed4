#include "runtime/Selection.h"

namespace cimple {

namespace {

thread_local Selection* innermost = nullptr;

} // namespace

Selection::Selection(const void* handler_data, Values values, Handler handler)
    : m_handler_data(handler_data), m_values(values), m_handler(handler), m_outer(innermost)
{
    innermost = this;
}

Selection::~Selection()
{
    innermost = m_outer;
}

Selection* Selection::of(const Enum_Handler& handler)
{
    Selection* selection = innermost;
    while (selection && selection->m_handler_data != handler.data)
        selection = selection->m_outer;
    return selection;
}

} // namespace cimple
