// What a CIM server hands over, of any type and shape, into the module's instances, and those back again.
#include "cmpi/Converter.h"
#include "cmpi/cmpi_data.h"
#include "fuzz/fuzzing.h"
#include "tests/cmpi/fake_broker.h"
#include "tests/cmpi/test_classes.h"

using namespace cimple;
using fuzzing::Bytes;
using fuzzing::expect;

namespace {

constexpr unsigned deepest = 40; // the bridge refuses what lies deeper than 32
constexpr unsigned most_values = 40;

const char* const class_names[] = {"TEST_Base",  "TEST_Part",    "TEST_Thing", "TEST_Link", "TEST_Pair",
                                   "TEST_Event", "TEST_Counter", "test_thing", "TEST_None", ""};
const char* const value_names[] = {"Name",  "Number", "Flag",    "Tiny",  "Speed",       "Offset",     "Count",
                                   "Delta", "Total",  "Balance", "Ratio", "Precise",     "Letter",     "Text",
                                   "When",  "Words",  "Codes",   "Flags", "Times",       "Part",       "Other",
                                   "Parts", "Others", "Id",      "Label", "Value",       "Antecedent", "Dependent",
                                   "Left",  "Wide",   "Target",  "Lines", "return_value"};
const CMPIType types[] = {CMPI_boolean,  CMPI_uint8,  CMPI_sint8,  CMPI_uint16,   CMPI_sint16,
                          CMPI_uint32,   CMPI_sint32, CMPI_uint64, CMPI_sint64,   CMPI_real32,
                          CMPI_real64,   CMPI_char16, CMPI_string, CMPI_dateTime, CMPI_ref,
                          CMPI_instance, CMPI_chars,  CMPI_null,   CMPI_class,    static_cast<CMPIType>(0x7777)};

/// Makes content for the broker out of an input. A budget of values bounds an input's size in memory.
class Maker {
public:
    explicit Maker(Bytes& bytes) : m_bytes(bytes) {}

    fake::Path path(unsigned depth) { return {"root/test", name_of_class(), values(depth + 1)}; }
    fake::Instance instance(unsigned depth) { return {path(depth), values(depth + 1)}; }

    fake::Values values(unsigned depth)
    {
        fake::Values made;
        for (unsigned left = m_bytes.byte() % 8; left > 0 && m_budget > 0; left--) {
            std::string name = name_of_value();
            made.emplace_back(std::move(name), value(depth));
        }
        return made;
    }

private:
    std::string name_of_class()
    {
        const std::uint8_t which = m_bytes.byte();
        return which < std::size(class_names) ? class_names[which] : m_bytes.short_text();
    }
    std::string name_of_value()
    {
        const std::uint8_t which = m_bytes.byte();
        return which < std::size(value_names) ? value_names[which] : m_bytes.short_text();
    }
    CMPIType type() { return types[m_bytes.byte() % std::size(types)]; }

    fake::Value value(unsigned depth)
    {
        if (m_budget > 0) m_budget--;
        const std::uint8_t shape = m_bytes.byte();
        if ((shape & 7) == 7) return array(depth);
        fake::Value made = scalar(type(), depth);
        if ((shape & 0x38) == 0x38) made.state = m_bytes.word();
        return made;
    }

    fake::Value array(unsigned depth)
    {
        const CMPIType element = type();
        std::vector<fake::Value> elements;
        for (unsigned left = m_bytes.byte() % 8; left > 0 && m_budget > 0; left--) {
            m_budget--;
            elements.push_back(scalar(m_bytes.byte() & 0x80 ? type() : element, depth));
        }
        return fake::array(element, std::move(elements));
    }

    fake::Value scalar(CMPIType type, unsigned depth)
    {
        fake::Value made;
        made.type = type;
        made.state = 0;
        if (type == CMPI_string || type == CMPI_dateTime) {
            made.null_text = m_bytes.byte() == 0;
            made.text = m_bytes.short_text();
        } else if (type == CMPI_ref || type == CMPI_instance) {
            if (depth >= deepest || m_budget == 0) return fake::null_value(type);
            return type == CMPI_ref ? fake::reference(path(depth)) : fake::embedded(instance(depth));
        } else if (type != CMPI_chars) {
            made.number.uint64 = m_bytes.wide();
        }
        return made;
    }

    Bytes& m_bytes;
    unsigned m_budget = most_values;
};

void expect_way_back(fake::Broker& broker, const Instance* read)
{
    if (!read) return;
    const Ref<Instance> copy(clone(read));
    Answer_Features features;
    for (const Instance* one : {read, static_cast<const Instance*>(copy.get()), read}) {
        Made<CMPIObjectPath> path;
        make_cmpi_object_path(&broker.cmpi, one, "root/test", path, &features);
        Made<CMPIInstance> made;
        make_CMPI_instance(&broker.cmpi, one, "root/test", path.get(), nullptr, made, &features);
    }
    String text;
    instance_to_model_path(copy.get(), text);
    key_eq(copy.get(), read);
}

} // namespace

extern "C" int LLVMFuzzerInitialize(int*, char***)
{
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    Bytes bytes(data, size);
    Maker maker(bytes);
    const Meta_Class* const wanted[] = {&TEST_Thing::meta, &TEST_Part::meta, &TEST_Link::meta, &TEST_Pair::meta};
    const Meta_Class* meta_class = wanted[bytes.byte() % std::size(wanted)];
    fake::Broker broker;
    const fake::Instance sent = maker.instance(0);
    const CMPIObjectPath* op = broker.path(sent.path);
    {
        Instance* read = nullptr;
        make_cimple_instance(&broker.cmpi, meta_class, op, broker.instance(sent), read);
        const Ref<Instance> owner(read);
        expect_way_back(broker, read);
    }
    {
        Instance* read = nullptr;
        make_cimple_reference(&broker.cmpi, meta_class, op, read);
        const Ref<Instance> owner(read);
        expect_way_back(broker, read);
    }
    {
        Instance* record = nullptr;
        make_cimple_method(&broker.cmpi, &TEST_Thing::meta, &TEST_Thing_Echo::meta, op, broker.args(sent.properties),
                           record);
        const Ref<Instance> owner(record);
        if (record) {
            Value result;
            make_method_out(&broker.cmpi, "root/test", record, broker.args(), result);
        }
    }
    for (const std::string& fault : broker.faults)
        expect(false, fault.c_str());
    return 0;
}
