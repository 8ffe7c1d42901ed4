#include "cmpi/cmpi_call.h"

namespace cimple {

const char* chars_of(const CMPIString* string)
{
    CMPIStatus status;
    const char* text = ask(status, string, &CMPIStringFT::getCharPtr);
    return status.rc == CMPI_RC_OK ? text : nullptr;
}

void release(CMPIString* object)
{
    tell(object, &CMPIStringFT::release);
}

void release(CMPIDateTime* object)
{
    tell(object, &CMPIDateTimeFT::release);
}

void release(CMPIArray* object)
{
    tell(object, &CMPIArrayFT::release);
}

void release(CMPIObjectPath* object)
{
    tell(object, &CMPIObjectPathFT::release);
}

void release(CMPIInstance* object)
{
    tell(object, &CMPIInstanceFT::release);
}

void release(CMPIArgs* object)
{
    tell(object, &CMPIArgsFT::release);
}

void release(CMPIEnumeration* object)
{
    tell(object, &CMPIEnumerationFT::release);
}

void release(CMPIContext* object)
{
    tell(object, &CMPIContextFT::release);
}

} // namespace cimple
