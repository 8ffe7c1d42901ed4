/* The CMPI declarations are also C: this file compiles, and that is the test. */
#include <cmpimacs.h>
#include <cmpios.h>

CMPIStatus set_number(CMPIInstance* instance, const char* name, CMPIUint32 number);

CMPIStatus set_number(CMPIInstance* instance, const char* name, CMPIUint32 number)
{
    return CMSetProperty(instance, name, &number, CMPI_uint32);
}
