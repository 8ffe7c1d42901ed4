// Traversals of every association class, from the instances that the class itself enumerates: which far ends and which
// associations a client is told, under each combination of role, result role and result class.
#include <algorithm>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "tests/module/support/Expected.h"
#include "tests/module/support/Instance_Text.h"
#include "tests/module/support/Quiet_Output.h"
#include "tests/module/support/Records.h"
#include "tests/module/support/Rig.h"
#include "tests/support/Cases.h"
#include "tests/support/private_host.h"

using namespace nvrtest;
using testing::IsEmpty;

namespace {

constexpr char smis_path[] = "/etc/nvr_smis.conf";

struct Filter {
    std::string result_class, role, result_role;
};

std::string to_text(const host::Path& source, const Filter& filter)
{
    return source.to_text() + " resultClass=" + filter.result_class + " role=" + filter.role +
           " resultRole=" + filter.result_role;
}

bool same_object(host::Path a, host::Path b)
{
    a.name_space.clear();
    b.name_space.clear();
    return a == b;
}

std::vector<std::string> to_texts(const std::vector<host::Path>& paths)
{
    std::vector<std::string> texts;
    for (const host::Path& path : paths)
        texts.push_back(path.to_text());
    return texts;
}

/// One association class, as its enumeration shows it.
struct Association {
    std::string name;
    std::vector<const host::Element_Record*> ends;
    std::vector<host::Instance> instances;
    const host::Schema& schema;

    bool passes(const std::string& name_or_empty, const std::string& end) const
    {
        return name_or_empty.empty() || host::same_name(name_or_empty, end);
    }
    bool holds(const host::Instance& instance, const host::Element_Record& end, const host::Path& source) const
    {
        const host::Path* path = instance.get(end.name).as_path();
        return path && same_object(*path, source);
    }

    std::vector<host::Path> far_ends(const host::Path& source, const Filter& filter) const
    {
        std::vector<host::Path> paths;
        for (const host::Instance& instance : instances) {
            bool is_near = false;
            std::vector<host::Path> found;
            for (const host::Element_Record* end : ends) {
                const host::Path* path = instance.get(end->name).as_path();
                if (!path) continue;
                if (holds(instance, *end, source)) {
                    is_near = is_near || passes(filter.role, end->name);
                    continue;
                }
                const host::Class_Record* of = schema.find(path->class_name);
                if (passes(filter.result_role, end->name) &&
                    (filter.result_class.empty() || (of && of->is_a(filter.result_class))))
                    found.push_back(*path);
            }
            if (is_near) paths.insert(paths.end(), found.begin(), found.end());
        }
        return paths;
    }

    std::vector<host::Instance> references(const host::Path& source, const std::string& role) const
    {
        std::vector<host::Instance> found;
        for (const host::Instance& instance : instances)
            if (std::any_of(ends.begin(), ends.end(), [&](const host::Element_Record* end) {
                    return passes(role, end->name) && holds(instance, *end, source);
                }))
                found.push_back(instance);
        return found;
    }
};

Association read_association(Rig& rig, const std::string& name)
{
    const host::Schema& schema = rig.server().schema();
    Association association{name, {}, rig.enumerate(name).instances, schema};
    for (const host::Element_Record& property : schema.find(name)->properties)
        if (property.type == CMPI_ref) association.ends.push_back(&property);
    return association;
}

std::string upper_case(std::string text)
{
    for (char& c : text)
        c = static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
    return text;
}

/// What a client may ask for, seen from `near`, which leads to `far`.
std::vector<Filter> filters(const host::Schema& schema, const std::string& near, const std::string& far,
                            const std::string& far_class)
{
    const host::Class_Record* of = schema.find(far_class);
    std::vector<Filter> all = {
        {"", "", ""},           {"", near, ""},         {"", upper_case(near), ""},      {"", far, ""},
        {"", "NoSuchRole", ""}, {"", "", far},          {"", "", host::lower_case(far)}, {"", "", near},
        {"", "", "NoSuchRole"}, {far_class, "", ""},    {upper_case(far_class), "", ""}, {"CIM_Job", "", ""},
        {far_class, near, far}, {far_class, far, near},
    };
    if (of && of->super) all.push_back({of->super->name, "", ""});
    for (const host::Class_Record* narrower : of ? of->subclasses : std::vector<const host::Class_Record*>{})
        all.push_back({narrower->name, "", ""});
    return all;
}

/// A key of the path is changed, so that nobody has it.
host::Path nobody(host::Path path)
{
    for (host::Named_Value& key : path.keys)
        if (key.value.type() == CMPI_string && key.name != "CreationClassName") {
            key.value = host::Value::string("nobody");
            break;
        }
    return path;
}

/// An object of that class that does not exist.
host::Path nobody(const host::Schema& schema, const std::string& class_name)
{
    host::Path path;
    path.name_space = "root/norvane";
    path.class_name = class_name;
    for (const host::Element_Record& property : schema.find(class_name)->properties)
        if (property.key && property.type == CMPI_string) path.set(property.name, host::Value::string("nobody"));
    return path;
}

/// `references` without a list of properties shows those that have no value as zeros and empty texts.
void drop_zeros(host::Instance& found, const host::Instance& wanted)
{
    const std::vector<std::string> zeros = {"0", "", "{}", "false", "0.000000", "00000000000000.000000:000"};
    auto& all = found.properties;
    all.erase(std::remove_if(all.begin(), all.end(),
                             [&](const host::Named_Value& property) {
                                 if (!wanted.get(property.name).is_null()) return false;
                                 EXPECT_THAT(zeros, testing::Contains(property.value.to_text())) << property.name;
                                 return true;
                             }),
              all.end());
}

class Traversal_Check {
public:
    Traversal_Check(Rig& rig, const Association& association) : m_server(rig.server()), m_association(association) {}

    void names(const host::Path& source, const Filter& filter)
    {
        const host::Answer answer = associator_names(source, filter);
        EXPECT_THAT(answer, succeeded()) << to_text(source, filter);
        EXPECT_EQ(to_texts(answer.paths), to_texts(m_association.far_ends(source, filter))) << to_text(source, filter);
    }

    /// The far ends themselves: those that the server can get.
    void instances(const host::Path& source, const Filter& filter)
    {
        const host::Answer answer = associators(source, filter);
        EXPECT_THAT(answer, succeeded()) << to_text(source, filter);
        std::vector<host::Instance> wanted;
        for (const host::Path& path : m_association.far_ends(source, filter)) {
            const host::Answer found = m_server.get(path);
            if (found.ok()) wanted.push_back(found.instances.at(0));
        }
        expect_same(answer.instances, wanted, to_text(source, filter));
    }

    void references(const host::Path& source, const std::string& role)
    {
        const std::string what = to_text(source, {"", role, ""});
        const std::vector<host::Instance> wanted = m_association.references(source, role);
        host::Answer answer = m_server.references(source, m_association.name, role);
        EXPECT_THAT(answer, succeeded()) << what;
        ASSERT_EQ(answer.instances.size(), wanted.size()) << what;
        for (std::size_t i = 0; i < wanted.size(); i++)
            drop_zeros(answer.instances[i], wanted[i]);
        expect_same(answer.instances, wanted, what);
        const host::Answer names = m_server.reference_names(source, m_association.name, role);
        EXPECT_THAT(names, succeeded()) << what;
        std::vector<host::Path> paths;
        for (const host::Instance& instance : wanted) {
            paths.push_back(instance.path);
            paths.back().name_space = source.name_space; // names of references are in the namespace of the question
        }
        EXPECT_EQ(to_texts(names.paths), to_texts(paths)) << what;
    }

    void nothing(const host::Path& source)
    {
        const std::string what = m_association.name + " of " + source.to_text();
        for (const host::Answer& answer :
             {associators(source, {}), associator_names(source, {}), m_server.references(source, m_association.name),
              m_server.reference_names(source, m_association.name)}) {
            EXPECT_THAT(answer, succeeded()) << what;
            EXPECT_THAT(answer.instances, IsEmpty()) << what;
            EXPECT_THAT(answer.paths, IsEmpty()) << what;
        }
    }

private:
    host::Answer associators(const host::Path& source, const Filter& filter)
    {
        const Quiet_Output quiet;
        return m_server.associators(source, m_association.name, filter.result_class, filter.role, filter.result_role);
    }
    host::Answer associator_names(const host::Path& source, const Filter& filter)
    {
        const Quiet_Output quiet;
        return m_server.associator_names(source, m_association.name, filter.result_class, filter.role,
                                         filter.result_role);
    }
    void expect_same(const std::vector<host::Instance>& found, const std::vector<host::Instance>& wanted,
                     const std::string& what)
    {
        EXPECT_EQ(difference(to_lines(m_association.name, wanted), to_lines(m_association.name, found)), "") << what;
    }

    host::Host& m_server;
    const Association& m_association;
};

/// All that is asked of one association class. Answers how many instances it has.
std::size_t check(Rig& rig, const std::string& name)
{
    const Association association = read_association(rig, name);
    const host::Schema& schema = rig.server().schema();
    Traversal_Check check(rig, association);
    EXPECT_GE(association.ends.size(), 2u) << name;
    for (const host::Element_Record* end : association.ends) {
        // Without keys it would agree with every object of a subclass.
        const host::Path stranger = nobody(schema, end->reference_class);
        if (!stranger.keys.empty()) check.nothing(stranger);
    }
    if (association.instances.empty()) return 0;

    const host::Instance& first = association.instances.front();
    const host::Instance& last = association.instances.back();
    for (std::size_t i = 0; i < association.ends.size(); i++) {
        const std::string& near = association.ends[i]->name;
        const std::string& far = association.ends[(i + 1) % association.ends.size()]->name;
        const host::Path* source = first.get(near).as_path();
        const host::Path* other = last.get(near).as_path();
        if (!source || !other || !first.get(far).as_path()) {
            ADD_FAILURE() << name << " has no end " << near;
            continue;
        }
        EXPECT_FALSE(association.far_ends(*source, {}).empty()) << name;
        for (const Filter& filter : filters(schema, near, far, first.get(far).as_path()->class_name))
            check.names(*source, filter);
        check.instances(*source, {});
        check.instances(*source, {"", host::lower_case(near), upper_case(far)});
        check.instances(*source, {"", far, ""});
        for (const std::string& role : {std::string(), near, upper_case(near), far, std::string("NoSuchRole")})
            check.references(*source, role);
        check.names(*other, {});
        check.references(*other, "");
        check.nothing(nobody(*source));
    }
    return association.instances.size();
}

} // namespace

class Traversals : public Every_Manner {
protected:
    // What else makes instances: a web launcher, a profile that other providers register, and the module's use.
    Traversals()
    {
        write_file(smis_path, "https://storage1.norvane.test:8443/launch\n");
        rig = std::make_unique<Rig>(Rig_Options{*GetParam()});
        host::Instance base;
        base.path.name_space = "root/pg_interop";
        base.path.class_name = "CIM_RegisteredProfile";
        base.set("InstanceID", host::Value::string("other:1"));
        base.set("RegisteredName", host::Value::string("Base Server"));
        rig->server().add_instance(base);
        leave_records(*rig);
    }
    ~Traversals() override { nvrtest::remove(smis_path); }

    const std::string typical = expected_text("typical.txt");
    const std::string neighbours = expected_text("neighbours.txt");
    std::unique_ptr<Rig> rig;
};
NVR_IN_EVERY_MANNER(Traversals);

TEST_P(Traversals, BeginAtTheInstancesThatNeighboursMake)
{
    for (const char* name : {"NVRHBA_RemoteServiceAccessPoint", "NVRHBA_RemoteHostedAccessPoint",
                             "NVRHBA_SAPAvailableForElement", "NVRHBA_BaseServerReferencedProfile"}) {
        EXPECT_EQ(lines_of_class(typical, name), "");
        const host::Answer answer = rig->enumerate(name);
        EXPECT_THAT(answer, succeeded());
        EXPECT_EQ(difference(lines_of_class(neighbours, name), to_lines(name, answer.instances)), "");
    }
}

TEST_P(Traversals, OfEveryAssociationClassFindWhatItsInstancesSay)
{
    // Nothing makes instances of these: three have no builder, and the provider's log takes no record.
    const std::set<std::string> empty = {"NVRHBA_ChassisContainsCard", "NVRHBA_HostedService",
                                         "NVRHBA_RecordLogManagesRecord", "NVRHBA_VMSystemDevice"};
    // Their answers all come from one walk over the maps.
    const std::size_t each = each_of_cases(1, 4);
    std::size_t classes = 0;
    for (const auto& row : expected_rows("providers.txt")) {
        if (row.at(1) != "association" || classes++ % each != 0) continue;
        EXPECT_EQ(check(*rig, row[0]) == 0, empty.count(row[0]) == 1) << row[0];
    }
    EXPECT_EQ(classes, 91u);
    EXPECT_THAT(rig->server().report().violations, IsEmpty());
}
