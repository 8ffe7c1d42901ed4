#include "cmpi/Filter_Record.h"

#include <new>

namespace cimple {

const Array_Traits& Traits_Of<Filter_Record>::traits()
{
    static constexpr Array_Traits record_traits = {
        sizeof(Filter_Record),
        [](void* element, const void* source) {
            new (element) Filter_Record(*static_cast<const Filter_Record*>(source));
        },
        [](void* element) { static_cast<Filter_Record*>(element)->~Filter_Record(); },
        [](const void* a, const void* b) {
            return static_cast<const Filter_Record*>(a)->name_space == static_cast<const Filter_Record*>(b)->name_space;
        },
    };
    return record_traits;
}

} // namespace cimple
