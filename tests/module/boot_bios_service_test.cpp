// The boot code of an adapter, switched and read.
#include <gmock/gmock.h>

#include "tests/module/support/Service.h"

using namespace nvrtest;
using testing::IsEmpty;

class BootBiosService : public Every_Manner {};
NVR_IN_EVERY_MANNER(BootBiosService);

TEST_P(BootBiosService, IsStartedWithoutAWord)
{
    Rig rig({*GetParam()});
    Service service(rig, "NVRHBA_BootBIOSService");
    for (const char* name : {"StartService", "startservice", "STARTSERVICE"}) {
        const Called called = service.call(name);
        EXPECT_THAT(called, returned(0)) << name;
        EXPECT_THAT(called.words, IsEmpty());
    }
}
