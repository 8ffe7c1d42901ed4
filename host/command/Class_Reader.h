/// Whole classes, read for joining: one request a class, and the first failure ends it.
///
/// One thread at a time.
#pragma once

#include "host/Host.h"

#include <string>
#include <unordered_map>
#include <vector>

namespace host {

class Class_Reader {
public:
    Class_Reader(Host& server, std::string name_space) : m_server(server), m_name_space(std::move(name_space)) {}

    /// The instances of the class and its subclasses; none after a failure.
    std::vector<Instance> all(const std::string& class_name);

    /// The instances of some classes by a property that tells them apart.
    using By_Key = std::unordered_map<std::string, Instance>;
    By_Key by_key(const std::vector<std::string>& classes, const char* key);

    /// An end of an association, and the key that tells its instances apart.
    struct End {
        const char* role;
        const char* key;
    };
    /// From the key of one end to those of the other.
    using Ties = std::unordered_multimap<std::string, std::string>;
    Ties ties(const std::string& association, End from, End to);

    const Status& status() const { return m_status; }

private:
    Host& m_server;
    const std::string m_name_space;
    Status m_status;
};

/// What a map has for the key, or an empty one.
template <class Map>
const typename Map::mapped_type& at(const Map& map, const std::string& key)
{
    static const typename Map::mapped_type none{};
    const auto found = map.find(key);
    return found == map.end() ? none : found->second;
}

/// The text of a key of the path that a reference holds; empty if there is none.
std::string key_of(const Value& reference, const char* key);

} // namespace host
