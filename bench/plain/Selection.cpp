// Providers are told nothing of what their caller will look at: they hand out all they have.
#include "runtime/Selection.h"

namespace cimple {

Selection::Selection(const void* handler_data, Values values, Handler handler)
    : m_handler_data(handler_data), m_values(values), m_handler(handler), m_outer(nullptr)
{
}

Selection::~Selection() = default;

Selection* Selection::of(const Enum_Handler&)
{
    return nullptr;
}

} // namespace cimple
