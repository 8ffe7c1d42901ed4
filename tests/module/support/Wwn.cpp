#include "tests/module/support/Wwn.h"

namespace nvrtest {

using host::Value;

Called Wwn::change(unsigned type, const std::string& wwpn, const std::string& wwnn)
{
    return m_service.call(
        "ChangeWWN",
        {{"Target", m_port}, {"NewWWPN", Value::string(wwpn)}, {"NewWWNN", Value::string(wwnn)}, type_of(type)});
}

host::Named_Value Wwn::type_of(unsigned type)
{
    return {"Type", Value::uint16(static_cast<std::uint16_t>(type))};
}

void expect_status(const Called& called, unsigned status)
{
    EXPECT_EQ(called.out("WWNOperationStatus"), Value::uint16(static_cast<std::uint16_t>(status)));
}

Words opened(const std::string& method, const std::string& device_id)
{
    return joined({{"Entering " + method, gate}, known_port(), converted(device_id)});
}

Words names_accepted(const std::string& wwpn, const std::string& wwnn)
{
    return joined({opened("ChangeWWN"), converted(wwpn), converted(wwnn)});
}

std::string fault(const std::string& call, const std::string& what)
{
    return "call = \"" + call + "\", " + what;
}

} // namespace nvrtest
