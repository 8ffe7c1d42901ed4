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
#include <vector>

namespace host {

/// What the HTTP headers of a request say; "" where one is missing.
struct Request_Head {
    std::string operation; ///< CIMOperation
    std::string method;    ///< CIMMethod
    std::string object;    ///< CIMObject
    std::string version;   ///< CIMProtocolVersion
    std::string batch;     ///< CIMBatch
    std::string host;      ///< Host: how the client names this server
};

struct Reply {
    unsigned status = 200;                    ///< of HTTP
    std::string cim_error;                    ///< value of the CIMError header, or ""
    std::function<bool(std::string&)> pieces; ///< appends the next piece; false when there was none left
};

class Cim_Server {
public:
    /// `address` is what paths name this server for clients that do not name it themselves ("localhost:5988"). The host
    /// outlives the object.
    Cim_Server(Host& host, std::string address);

    /// What the head says must agree with the body.
    Reply answer(std::string_view body, const Request_Head& head);

private:
    struct Content;
    struct Operation;

    void check_name_space(const std::string& name_space) const;
    const Class_Record& class_of(const std::string& name) const;
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
    Content only_paths(Answer answer, const Message& message);
    std::vector<const Class_Record*> classes_asked(const Message& message) const;

    static const Operation operations[];

    Host& m_host;
    const std::string m_address;
    Subscriptions m_subscriptions;
};

} // namespace host
