/// The service of World Wide Names on the first port, for its tests: its methods, and the words that they begin with.
#pragma once

#include <string>

#include "tests/module/support/Service.h"

namespace nvrtest {

constexpr char wwn_service_class[] = "NVRHBA_FCHBAWWNService";
/// Names that no port has.
constexpr char new_wwpn[] = "10000000C9A0F001";
constexpr char new_wwnn[] = "20000000C9A0F001";
/// WWNOperationStatus where there is none to tell.
constexpr unsigned untold = 65535;

class Wwn {
public:
    explicit Wwn(Rig& rig) : m_service(rig, wwn_service_class), m_port(port(rig)) {}

    Called change(unsigned type, const std::string& wwpn = new_wwpn, const std::string& wwnn = new_wwnn);
    Called restore(unsigned type) { return m_service.call("RestoreWWN", {{"Target", m_port}, type_of(type)}); }
    Called read(unsigned type) { return m_service.call("ReadWWN", {{"Target", m_port}, type_of(type)}); }
    Called capability() { return m_service.call("GetWWNCapability", {{"Target", m_port}}); }
    Service& service() { return m_service; }

private:
    static host::Named_Value type_of(unsigned type);

    Service m_service;
    const host::Value m_port;
};

void expect_status(const Called& called, unsigned status);

/// What a method logs until its Target is accepted.
Words opened(const std::string& method, const std::string& device_id = first_port);
/// The same for a change whose names are accepted too.
Words names_accepted(const std::string& wwpn = new_wwpn, const std::string& wwnn = new_wwnn);

/// A fault as add_fault takes it.
std::string fault(const std::string& call, const std::string& what);

} // namespace nvrtest
