// One request as one call of a function of an MI's table: arguments made, results taken.
#include "host/Dispatcher.h"

#include "host/Convert.h"
#include "host/ProviderCall.h"
#include "host/objects/ArgsObject.h"
#include "host/objects/InstanceObject.h"
#include "host/objects/PathObject.h"
#include "host/objects/ResultObject.h"

namespace host {
namespace {

using Operation = Request::Operation;
using Takes = Result_Object::Takes;

/// What a class's property or key type makes of a client's value: integers get the declared width.
Value typed(const Element_Record* element, const Value& value)
{
    if (!element || value.is_null() || !is_integer(element->type) || !is_integer(value.type())) return value;
    return Value::integer(element->type, value.as_uint());
}

/// A null-terminated array of names as CMPI has property lists, or null.
class Names {
public:
    explicit Names(const Property_List& list)
    {
        if (!list) return;
        for (const std::string& name : *list)
            m_names.push_back(name.c_str());
        m_names.push_back(nullptr);
    }
    const char** get() { return m_names.empty() ? nullptr : m_names.data(); }

private:
    std::vector<const char*> m_names;
};

const char* or_null(const std::string& text)
{
    return text.empty() ? nullptr : text.c_str();
}

/// Everything that a call needs, made in the scope of the call and lent to the module.
class Mi_Call {
public:
    Mi_Call(Broker& broker, const Request& request, const std::string& class_name, Answer& answer)
        : m_broker(broker), m_request(request), m_class_name(class_name), m_names(request.properties),
          m_context(broker.make_request_context(request.principal, request.path.name_space)), m_answer(answer)
    {
        Path path = request.path;
        if (request.operation == Operation::enumerate || request.operation == Operation::names ||
            request.operation == Operation::exec_query)
            path.class_name = class_name;
        path.host = broker.manner().host_name_in_paths ? broker.host_name() : "";
        m_path = &broker.make<Path_Object>(Origin::lent, std::move(path))->face;
    }

    Status run(Mi kind, void* mi)
    {
        if (kind == Mi::instance) return run(static_cast<CMPIInstanceMI*>(mi));
        if (kind == Mi::association) return run(static_cast<CMPIAssociationMI*>(mi));
        if (kind == Mi::method) return run(static_cast<CMPIMethodMI*>(mi));
        return run(static_cast<CMPIPropertyMI*>(mi));
    }

private:
    Status run(CMPIInstanceMI* mi)
    {
        CMPIInstanceMIFT* ft = mi->ft;
        switch (m_request.operation) {
        case Operation::enumerate:
            return call(mi, ft, &CMPIInstanceMIFT::enumerateInstances, result(Takes::instances, m_class_name), m_path,
                        m_names.get());
        case Operation::names:
            return call(mi, ft, &CMPIInstanceMIFT::enumerateInstanceNames, result(Takes::paths, m_class_name), m_path);
        case Operation::get:
            return call(mi, ft, &CMPIInstanceMIFT::getInstance, result(Takes::instances, m_class_name), m_path,
                        m_names.get());
        case Operation::create:
            return call(mi, ft, &CMPIInstanceMIFT::createInstance, result(Takes::paths, m_class_name), m_path,
                        instance());
        case Operation::modify:
            return call(mi, ft, &CMPIInstanceMIFT::modifyInstance, result(Takes::paths, m_class_name), m_path,
                        instance(), m_names.get());
        case Operation::remove:
            return call(mi, ft, &CMPIInstanceMIFT::deleteInstance, result(Takes::nothing, ""), m_path);
        default:
            return call(mi, ft, &CMPIInstanceMIFT::execQuery, result(Takes::instances, ""), m_path,
                        m_request.query.c_str(), m_request.language.c_str());
        }
    }

    Status run(CMPIAssociationMI* mi)
    {
        CMPIAssociationMIFT* ft = mi->ft;
        const bool filled = m_broker.manner().association_class_filled;
        const char* association = filled ? m_class_name.c_str() : or_null(m_request.association_class);
        const char* result_class = or_null(m_request.result_class);
        const char* role = or_null(m_request.role);
        const char* result_role = or_null(m_request.result_role);
        switch (m_request.operation) {
        case Operation::associators:
            return call(mi, ft, &CMPIAssociationMIFT::associators, result(Takes::instances, m_request.result_class),
                        m_path, association, result_class, role, result_role, m_names.get());
        case Operation::associator_names:
            return call(mi, ft, &CMPIAssociationMIFT::associatorNames, result(Takes::paths, m_request.result_class),
                        m_path, association, result_class, role, result_role);
        case Operation::references:
            return call(mi, ft, &CMPIAssociationMIFT::references, result(Takes::instances, m_class_name), m_path,
                        filled ? m_class_name.c_str() : result_class, role, m_names.get());
        default:
            return call(mi, ft, &CMPIAssociationMIFT::referenceNames, result(Takes::paths, m_class_name), m_path,
                        filled ? m_class_name.c_str() : result_class, role);
        }
    }

    Status run(CMPIMethodMI* mi)
    {
        auto* in = m_broker.make<Args_Object>(Origin::lent, m_request.arguments);
        auto* out = m_broker.make<Args_Object>(Origin::lent, std::vector<Named_Value>());
        Status status = call(mi, mi->ft, &CMPIMethodMIFT::invokeMethod, result(Takes::data, ""), m_path,
                             m_request.name.c_str(), &in->face, &out->face);
        m_answer.out = std::move(out->values);
        return status;
    }

    Status run(CMPIPropertyMI* mi)
    {
        if (m_request.operation == Operation::get_property)
            return call(mi, mi->ft, &CMPIPropertyMIFT::getProperty, result(Takes::data, ""), m_path,
                        m_request.name.c_str());
        const Class_Record* record = m_broker.schema().find(m_class_name);
        Value value = typed(record ? record->property(m_request.name) : nullptr, m_request.value);
        return call(mi, mi->ft, &CMPIPropertyMIFT::setProperty, result(Takes::nothing, ""), m_path,
                    m_request.name.c_str(), data_of(m_broker, value, Origin::got));
    }

    /// Calls a slot of the table, if the module filled it.
    template <class Face, class Table, class Slot, class... Arguments>
    Status call(Face* mi, Table* table, Slot Table::*slot, CMPIResult* result, Arguments... arguments)
    {
        if (!table || !(table->*slot))
            return {CMPI_RC_ERR_NOT_SUPPORTED,
                    std::string("the provider has no ") + operation_name(m_request.operation), Fault::provider};
        CMPIStatus status = status_of(CMPI_RC_OK);
        Status guarded = guard(m_broker, operation_name(m_request.operation),
                               [&] { status = (table->*slot)(mi, m_context, result, arguments...); });
        return guarded.ok() ? read_status(status) : guarded;
    }

    CMPIResult* result(Takes takes, const std::string& class_name)
    {
        return &m_broker.make<Result_Object>(Origin::lent, m_answer, m_request.sink, takes, class_name)->face;
    }

    const CMPIInstance* instance()
    {
        Instance given = m_request.instance;
        given.path = m_request.path;
        const Class_Record* record = m_broker.schema().find(given.path.class_name);
        for (Named_Value& property : given.properties)
            property.value = typed(record ? record->property(property.name) : nullptr, property.value);
        return &m_broker.make<Instance_Object>(Origin::lent, std::move(given))->face;
    }

    Broker& m_broker;
    const Request& m_request;
    const std::string& m_class_name;
    Names m_names;
    const CMPIContext* m_context;
    const CMPIObjectPath* m_path = nullptr;
    Answer& m_answer;
};

} // namespace

Status call_mi(Broker& broker, const Request& request, Mi kind, void* mi, const std::string& class_name, Answer& answer)
{
    return Mi_Call(broker, request, class_name, answer).run(kind, mi);
}

} // namespace host
