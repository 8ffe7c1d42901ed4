#include "simulator/PortReader.h"

#include <algorithm>

namespace nvrsim {

namespace {

void read_fc4(Fields& fields, const char* key, std::array<uint8_t, 32>& types)
{
    const toml::node* node = fields.find(key);
    if (!node) return;
    if (node->is_string()) { // the 32 bytes as they are
        const Bytes raw = fields.to_bytes(*node, key, types.size(), types.size());
        std::copy(raw.begin(), raw.end(), types.begin());
        return;
    }
    const toml::array* numbers = node->as_array();
    if (!numbers) fields.fail(*node, std::string("\"") + key + "\" must be an array of FC-4 types or 32 bytes in hex");
    types.fill(0);
    for (const toml::node& number : *numbers) {
        const uint64_t type = fields.to_number(number, key, 0, 255);
        types[4 * (type / 32) + 3 - type % 32 / 8] |= static_cast<uint8_t>(1u << type % 8);
    }
}

void read_vpd(Fields& port, Port& target)
{
    const toml::node* node = port.find("vpd");
    if (!node) return;
    if (node->is_boolean() && !node->as_boolean()->get()) {
        target.vpd.reset();
        return;
    }
    if (!node->is_table()) port.fail(*node, "\"vpd\" must be a table, or false for none");
    Fields fields(port.file(), *node->as_table());
    fields.bytes("raw", target.vpd, 0, RM_VPD_SIZE - sizeof(uint32_t));
    std::string product = "Norvane FC2162 16Gb 2-Port PCIe Fibre Channel Adapter";
    fields.text("product", product);
    std::vector<std::pair<std::string, std::string>> entries;
    if (const toml::array* list = fields.array("entries"))
        for (const toml::node& entry : *list) {
            const toml::array* pair = entry.as_array();
            if (!pair || pair->size() != 2) fields.fail(entry, "an entry must be [\"XX\", \"value\"]");
            const std::string tag = fields.to_string(*pair->get(0), "tag", 2);
            if (tag.size() != 2) fields.fail(entry, "a tag must have two letters");
            entries.emplace_back(tag, fields.to_string(*pair->get(1), "value", 255));
        }
    if (!fields.has("raw")) {
        target.vpd = build_vpd(product, entries);
        if (target.vpd->size() > RM_VPD_SIZE - sizeof(uint32_t)) fields.fail("the data is longer than 1020 bytes");
    }
    fields.refuse_unknown();
}

void read_transceiver(Fields& port, Port& target)
{
    const toml::node* node = port.find("transceiver");
    if (!node) return;
    if (node->is_boolean() && !node->as_boolean()->get()) {
        target.sffA0.reset();
        target.sffA2.reset();
        return;
    }
    if (!node->is_table()) port.fail(*node, "\"transceiver\" must be a table, or false for none");
    Fields fields(port.file(), *node->as_table());
    Transceiver module;
    fields.text("vendor", module.vendor, 16);
    fields.text("part_number", module.partNumber, 16);
    fields.text("revision", module.revision, 4);
    fields.text("serial", module.serial, 16);
    fields.text("date_code", module.dateCode, 8);
    fields.number("oui", module.oui, 0, 0xFFFFFF);
    fields.number("wavelength", module.wavelength, 0, 65535);
    fields.number("identifier", module.identifier);
    fields.number("ext_identifier", module.extIdentifier);
    fields.number("connector", module.connector);
    fields.real("temperature", module.temperature, -128, 127.99);
    fields.real("vcc", module.vcc, 0, 6.5535);
    fields.real("tx_bias", module.txBias, 0, 131.07);
    fields.real("tx_power", module.txPower, 0, 6.5535);
    fields.real("rx_power", module.rxPower, 0, 6.5535);
    fields.boolean("diagnostics", module.diagnostics);
    target.sffA0 = build_sff_a0(module);
    target.sffA2 = module.diagnostics ? std::optional<Bytes>(build_sff_a2(module)) : std::nullopt;
    fields.bytes("a0", target.sffA0, 256, 256);
    fields.bytes("a2", target.sffA2, 256, 256);
    fields.refuse_unknown();
}

void read_pci(Fields& port, Port& target)
{
    const toml::table* table = port.table("pci");
    if (!table) return;
    Fields fields(port.file(), *table);
    Pci_Header header;
    const struct {
        const char* key;
        uint32_t* field;
        uint32_t high;
    } rows[] = {
        {"vendor", &header.vendor, 0xFFFF},
        {"device", &header.device, 0xFFFF},
        {"command", &header.command, 0xFFFF},
        {"status", &header.status, 0xFFFF},
        {"revision", &header.revision, 0xFF},
        {"prog_if", &header.progIf, 0xFF},
        {"sub_class", &header.subClass, 0xFF},
        {"base_class", &header.baseClass, 0xFF},
        {"cache_line_size", &header.cacheLineSize, 0xFF},
        {"latency_timer", &header.latencyTimer, 0xFF},
        {"header_type", &header.headerType, 0xFF},
        {"bist", &header.bist, 0xFF},
        {"cis", &header.cis, 0xFFFFFFFF},
        {"sub_vendor", &header.subVendor, 0xFFFF},
        {"subsystem", &header.subsystem, 0xFFFF},
        {"rom", &header.rom, 0xFFFFFFFF},
        {"capabilities", &header.capabilities, 0xFF},
        {"interrupt_line", &header.interruptLine, 0xFF},
        {"interrupt_pin", &header.interruptPin, 0xFF},
        {"min_grant", &header.minGrant, 0xFF},
        {"max_latency", &header.maxLatency, 0xFF},
    };
    for (const auto& row : rows)
        fields.number(row.key, *row.field, 0, row.high);
    if (const toml::array* bases = fields.array("bases")) {
        if (bases->size() > header.bases.size()) fields.fail(*bases, "\"bases\" has more than 6 addresses");
        header.bases.fill(0);
        for (size_t i = 0; i < bases->size(); ++i)
            header.bases[i] = static_cast<uint32_t>(fields.to_number(*bases->get(i), "bases", 0, UINT32_MAX));
    }
    target.pci = build_pci(header);
    Bytes raw;
    fields.bytes("raw", raw, 0, sizeof(RM_PCIREGISTERS));
    std::copy(raw.begin(), raw.end(), target.pci.begin());
    fields.refuse_unknown();
}

void read_flash(Fields& port, Port& target)
{
    if (!port.has("flash")) return;
    target.flash.clear();
    for (const toml::table* table : port.tables("flash")) {
        Fields fields(port.file(), *table);
        Flash_Image image{"Firmware", "2.01a4", 1, 0x80000};
        fields.text("name", image.name, sizeof(RM_FLASHIMAGE::name));
        fields.text("version", image.version, sizeof(RM_FLASHIMAGE::version));
        fields.number("type", image.type);
        fields.number("size", image.size);
        fields.refuse_unknown();
        target.flash.push_back(image);
    }
    if (target.flash.size() > RM_FLASH_MAX_IMAGES) port.fail("there can be 64 flash images at most");
}

void read_vports(Fields& port, Port& target)
{
    for (const toml::table* table : port.tables("vport")) {
        Fields fields(port.file(), *table);
        Virtual_Port vport;
        // Virtual names follow from the port's: the second byte counts, so that they collide with no other port's.
        const Wwn step = static_cast<Wwn>(target.vports.size() + 1) << 48;
        vport.wwpn = (target.current.wwpn & ~(Wwn(0xFF) << 48)) + step;
        vport.wwnn = (target.current.wwnn & ~(Wwn(0xFF) << 48)) + step;
        vport.fcId = target.fcId + static_cast<uint32_t>(target.vports.size()) + 1;
        vport.name = "vport " + std::to_string(target.vports.size());
        fields.wwn("wwpn", vport.wwpn);
        fields.wwn("wwnn", vport.wwnn);
        fields.number("fc_id", vport.fcId);
        fields.number("state", vport.state);
        fields.text("name", vport.name, sizeof(RM_VPORTATTRIBUTES::name) - 1);
        for (const toml::table* entry : fields.tables("vm")) {
            Fields inner(port.file(), *entry);
            Virtual_Machine machine{"vm-" + std::to_string(vport.machines.size()), "server", "machine", "Linux", 4096};
            inner.text("identity", machine.identity);
            inner.text("server", machine.server);
            inner.text("name", machine.name);
            inner.text("guest_os", machine.guestOs);
            inner.number("memory", machine.memory);
            inner.refuse_unknown();
            vport.machines.push_back(machine);
        }
        fields.refuse_unknown();
        target.vports.push_back(vport);
    }
}

void read_diagnostics(Fields& port, Port& target)
{
    const toml::table* table = port.table("diagnostics");
    if (!table) return;
    Fields fields(port.file(), *table);
    Diagnostics& diagnostics = target.diagnostics;
    fields.boolean("available", diagnostics.available);
    fields.boolean("can_cancel", diagnostics.canCancel);
    fields.number("polls", diagnostics.polls);
    fields.number("running_state", diagnostics.runningState);
    fields.number("running_status", diagnostics.runningStatus);
    fields.number("state", diagnostics.state);
    fields.number("seconds", diagnostics.seconds);
    fields.number("cycles", diagnostics.cycles);
    fields.number("loops_failed", diagnostics.loopsFailed);
    fields.number("cancel_polls", diagnostics.cancelPolls);
    for (const char* kind : {"post", "loopback", "external_loopback", "pci_loopback", "echo"}) {
        std::optional<uint32_t> result;
        fields.number(kind, result);
        if (result) diagnostics.results[kind] = *result;
    }
    fields.refuse_unknown();
}

void read_names(Fields& port, Port& target)
{
    port.wwn("wwpn", target.factory.wwpn);
    port.wwn("wwnn", target.factory.wwnn);
    target.current = target.factory;
    for (const char* kind : {"nonvolatile", "volatile"}) {
        const toml::table* table = port.table(kind);
        if (!table) continue;
        Fields fields(port.file(), *table);
        Names names = target.current;
        fields.wwn("wwpn", names.wwpn);
        fields.wwn("wwnn", names.wwnn);
        fields.refuse_unknown();
        (kind[0] == 'n' ? target.nonVolatile : target.volatileNames) = names;
        target.current = names;
    }
}

void read_answer(Fields& fields, const char* key, const char* statusKey, Scsi_Answer& answer, bool& any)
{
    fields.bytes(key, answer.bytes, 0, 4096);
    fields.number(statusKey, answer.status);
    any = any || answer.bytes || answer.status;
}

} // namespace

void read_adapter_fields(Fields& fields, Adapter& adapter, uint32_t number)
{
    fields.text("name", adapter.name);
    if (number != UINT32_MAX && fields.has("name")) adapter.name += "-" + std::to_string(number);
    fields.boolean("present", adapter.present);
    fields.text("manufacturer", adapter.manufacturer, 63);
    fields.text("serial_number", adapter.serialNumber, 63);
    fields.text("model", adapter.model);
    fields.text("model_description", adapter.modelDescription);
    fields.text("node_symbolic_name", adapter.nodeSymbolicName);
    fields.text("hardware_version", adapter.hardwareVersion);
    fields.text("driver_version", adapter.driverVersion);
    fields.text("option_rom_version", adapter.optionRomVersion);
    fields.text("firmware_version", adapter.firmwareVersion);
    fields.text("driver_name", adapter.driverName);
    fields.wwn("node_wwn", adapter.nodeWwn);
    fields.number("vendor_specific_id", adapter.vendorSpecificId);
    fields.number("number_of_ports", adapter.numberOfPorts);
    fields.number("tag_flag", adapter.tagFlag);
    for (const toml::table* table : fields.tables("tag")) {
        Fields inner(fields.file(), *table);
        Tag_Entry entry{firstPortName, firstTargetPort, 1};
        inner.wwn("source", entry.source);
        inner.wwn("target", entry.target);
        inner.number("tag", entry.tag);
        inner.refuse_unknown();
        adapter.tags.push_back(entry);
    }
}

void read_port(Fields& fields, Port& port)
{
    read_names(fields, port);
    fields.number("wwn_capability", port.wwnCapability);
    fields.number("fc_id", port.fcId, 0, 0xFFFFFF);
    fields.number("type", port.type);
    fields.number("state", port.state);
    fields.number("class_of_service", port.classOfService);
    read_fc4(fields, "supported_fc4", port.supportedFc4);
    read_fc4(fields, "active_fc4", port.activeFc4);
    fields.text("symbolic_name", port.symbolicName);
    fields.text("os_device_name", port.osDeviceName);
    fields.number("supported_speed", port.supportedSpeed);
    fields.number("speed", port.speed);
    port.linkUpSpeed = port.speed;
    fields.number("max_frame_size", port.maxFrameSize);
    fields.wwn("fabric_name", port.fabricName);
    fields.number("discovered_ports", port.discoveredPorts);
    fields.boolean("local", port.local);
    fields.boolean("enabled", port.enabled);
    fields.boolean("enable_needs_reset", port.enableNeedsReset);
    fields.boolean("loopback_plug", port.loopbackPlug);
    fields.boolean("firmware_needs_reboot", port.firmwareNeedsReboot);
    fields.number("boot_code", port.bootCode, 0, 1);
    fields.number("driver_type", port.driverType);
    fields.number("reset_ms", port.resetMilliseconds);
    fields.number("retention", port.retention);
    fields.text("dump_directory", port.dumpDirectory);
    if (const toml::array* dumps = fields.array("dumps"))
        for (const toml::node& name : *dumps)
            port.dumps.push_back(fields.to_string(name, "dumps", 255));

    uint32_t beacon = port.beacon - RM_BEACON_NOT_AVAILABLE;
    fields.word("beacon", beacon, {"unavailable", "off", "on", "unsupported"});
    port.beacon = beacon == 3 ? static_cast<uint32_t>(RM_BEACON_OFF) : beacon + RM_BEACON_NOT_AVAILABLE;
    port.beaconStatus = beacon == 3 ? static_cast<uint32_t>(RM_STATUS_NOT_SUPPORTED) : 0;

    port.adapterAttributes[RM_ATTR_BOOT_CODE_ENABLED] = encode32(port.bootCode);
    fields.attributes("attributes", port.adapterAttributes, false);
    fields.attributes("port_attributes", port.portAttributes, false);
    fields.attributes("statistics", port.statistics, true);
    read_vpd(fields, port);
    read_transceiver(fields, port);
    read_pci(fields, port);
    read_params(fields, "params", port.params);
    read_flash(fields, port);
    read_vports(fields, port);
    read_diagnostics(fields, port);
}

void read_lun(Fields& fields, Lun& lun)
{
    fields.find("number"); // both belong to the caller, who numbers the units
    fields.find("count");
    Bytes fcpLun;
    fields.bytes("fcp_lun", fcpLun, lun.fcpLun.size(), lun.fcpLun.size());
    std::copy(fcpLun.begin(), fcpLun.end(), lun.fcpLun.begin());
    fields.number("device_type", lun.deviceType, 0, 31);
    if (lun.deviceType == 1) lun.product = "VIRTUAL-TAPE";
    lun.blocks = default_blocks(lun.deviceType, lun.number);
    fields.text("vendor", lun.vendor, 8);
    fields.text("product", lun.product, 16);
    fields.text("revision", lun.revision, 4);
    fields.text("serial", lun.serial, 251);
    fields.text("os_device_name", lun.osDeviceName);
    fields.number("os_lun", lun.number);
    fields.number("block_size", lun.blockSize);
    fields.number("blocks", lun.blocks);
    fields.bytes("identifier", lun.identifier, 0, 247);
    fields.number("identifier_type", lun.identifierType, 0, 15);
    fields.number("identifier_code_set", lun.identifierCodeSet, 0, 15);

    auto answers = std::make_unique<Scsi_Answers>();
    bool any = fields.has("sense");
    fields.bytes("sense", answers->sense, 0, 252);
    read_answer(fields, "inquiry", "inquiry_status", answers->inquiry, any);
    read_answer(fields, "page80", "page80_status", answers->page80, any);
    read_answer(fields, "page83", "page83_status", answers->page83, any);
    read_answer(fields, "capacity", "capacity_status", answers->capacity, any);
    if (any) lun.answers = std::move(answers);
}

void read_params(Fields& fields, const char* key, std::vector<Driver_Param>& params)
{
    const toml::node* node = fields.find(key);
    if (!node) return;
    if (node->is_integer()) { // that many numbered ones, for long lists
        const uint64_t count = fields.to_number(*node, key, 0, 100000);
        params.clear();
        for (uint64_t i = 0; i < count; ++i)
            params.push_back({"param-" + std::to_string(i), "Numbered parameter", 0, 1000, 1, 1, 1, 1});
        return;
    }
    params.clear();
    for (const toml::table* table : fields.tables(key)) {
        Fields inner(fields.file(), *table);
        Driver_Param param;
        param.high = UINT32_MAX;
        inner.text("name", param.name, sizeof(RM_DRIVERPARAM::name));
        inner.text("help", param.help, sizeof(RM_DRIVERPARAM::help));
        inner.number("low", param.low);
        inner.number("high", param.high);
        inner.number("default", param.defaultValue);
        param.current = param.defaultValue;
        inner.number("current", param.current);
        inner.number("export", param.exportFlag);
        inner.number("dynamic", param.dynamic);
        if (param.name.empty()) inner.fail("a driver parameter needs a \"name\"");
        inner.refuse_unknown();
        params.push_back(param);
    }
}

Fault read_fault(const std::string& file, const toml::table& table)
{
    Fields fields(file, table);
    Fault fault;
    fields.text("call", fault.call);
    if (fault.call.empty()) fields.fail("a fault needs a \"call\"");
    if (const toml::node* port = fields.find("port")) {
        if (port->is_integer())
            fault.ordinal = static_cast<uint32_t>(fields.to_number(*port, "port", 0, UINT32_MAX));
        else
            fault.wwpn = fields.to_wwn(*port, "port");
    }
    fields.number("number", fault.number);
    fields.number("from", fault.from, 1);
    fields.number("times", fault.times, 1);
    if (const toml::node* status = fields.find("status")) {
        if (!status->is_integer()) fields.fail(*status, "\"status\" must be a number");
        fault.status = status->as_integer()->get();
    }
    fields.number("delay_ms", fault.delay, 0, 3600000);
    fields.number("value", fault.value);
    uint32_t damage = 0;
    fields.word("damage", damage, {"none", "garbage", "truncated", "ones", "zeros", "null", "unterminated"});
    fault.damage = static_cast<Damage>(damage);
    fields.number("keep", fault.keep);
    fields.boolean("absent", fault.absent);
    fields.boolean("throws", fault.throws);
    fields.boolean("vanish", fault.vanish);
    fields.refuse_unknown();
    return fault;
}

} // namespace nvrsim
