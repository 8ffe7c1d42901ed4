#include "host/command/Class_Reader.h"

namespace host {

std::vector<Instance> Class_Reader::all(const std::string& class_name)
{
    if (!m_status.ok()) return {};
    Answer answer = m_server.enumerate(m_name_space, class_name);
    m_status = answer.status;
    return std::move(answer.instances);
}

Class_Reader::By_Key Class_Reader::by_key(const std::vector<std::string>& classes, const char* key)
{
    By_Key found;
    for (const std::string& name : classes)
        for (Instance& instance : all(name)) {
            std::string text = instance.get(key).as_text();
            found.emplace(std::move(text), std::move(instance));
        }
    return found;
}

Class_Reader::Ties Class_Reader::ties(const std::string& association, End from, End to)
{
    Ties ties;
    for (const Instance& each : all(association))
        ties.emplace(key_of(each.get(from.role), from.key), key_of(each.get(to.role), to.key));
    return ties;
}

std::string key_of(const Value& reference, const char* key)
{
    const Path* path = reference.as_path();
    const Value* value = path ? path->find(key) : nullptr;
    return value ? value->as_text() : "";
}

} // namespace host
