/// The CIM operations of a host, as CIM-XML messages (DMTF DSP0200): a request's body in, an answer's body out, piece
/// by piece, so that a large answer is never one text. Knows no HTTP but the status that an answer needs.
///
/// Any thread, many at once. Nothing is thrown.
#pragma once

#include "host/Host.h"
#include "host/serve/Message.h"
#include "host/serve/Subscriptions.h"

#include <functional>
#include <memory>
#include <string>
#include <string_view>

namespace host {

struct Reply {
    unsigned status = 200;                    ///< of HTTP
    std::string cim_error;                    ///< value of the CIMError header, or ""
    std::function<bool(std::string&)> pieces; ///< appends the next piece; false when there was none left
};

class Cim_Server {
public:
    /// `address` is this server's own, as paths name it ("localhost:5988"). Both outlive the object.
    Cim_Server(Host& host, std::string address);

    /// `method` and `object` are the CIMMethod and CIMObject headers ("" for none); they must agree with the body.
    Reply answer(std::string_view body, const std::string& method, const std::string& object);

private:
    struct Content;
    struct Operation;

    void check_headers(const Message& message, const std::string& method, const std::string& object) const;
    void check_name_space(const std::string& name_space) const;
    const Class_Record& class_of(const Message& message, const std::string& name) const;
    Content run(const Message& message);
    Content invoke(const Message& message);

    Content get_class(const Message& message);
    Content enumerate_classes(const Message& message);
    Content enumerate_class_names(const Message& message);
    Content enumerate_instances(const Message& message);
    Content enumerate_instance_names(const Message& message);
    Content get_instance(const Message& message);
    Content create_instance(const Message& message);
    Content modify_instance(const Message& message);
    Content delete_instance(const Message& message);
    Content get_property(const Message& message);
    Content set_property(const Message& message);
    Content associators(const Message& message);
    Content associator_names(const Message& message);
    Content references(const Message& message);
    Content reference_names(const Message& message);
    Content exec_query(const Message& message);

    Content with_paths(Answer answer, const Message& message);
    Content only_paths(Answer answer);
    std::vector<const Class_Record*> classes_asked(const Message& message) const;

    static const Operation operations[];

    Host& m_host;
    const std::string m_address;
    Subscriptions m_subscriptions;
};

} // namespace host
