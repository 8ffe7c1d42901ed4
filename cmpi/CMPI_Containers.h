/// The three containers over CMPI objects: an instance's properties, an object path's keys, a call's arguments.
///
/// They differ only in the CMPI calls they make, and in which values of another type they accept: a path narrows
/// integers, arguments read scalars out of strings, an instance takes nothing but the type of its property.
#pragma once

#include <cmpift.h>

#include "cmpi/Container.h"

namespace cimple {

/// What the three have in common. `name_space` stands in for instances that have none of their own; it may be null
/// where nothing is written, and must outlive the container.
class CMPI_Container : public Container {
public:
    std::size_t get_size() final;
    int get_name(std::size_t index, const char*& name) final;
    int get_value(std::size_t index, int expected_type, Value& value) final;

protected:
    CMPI_Container(const CMPIBroker* broker, const Meta_Repository* repository, const char* name_space, unsigned depth)
        : Container(repository, depth), m_broker(broker), m_name_space(name_space)
    {
    }

    /// The number of elements of the CMPI object; asked once.
    virtual std::size_t count() = 0;
    /// Reads the element at `index` out of the CMPI object, name and data by one call. 0 on success.
    virtual int read(std::size_t index, CMPIString*& name, CMPIData& data) = 0;
    /// Converts data that was read, with the casts of the container. 0 on success.
    virtual int take(CMPIData& data, int expected_type, Value& value);

    const CMPIBroker* m_broker;
    const char* m_name_space;

private:
    static constexpr std::size_t not_known = static_cast<std::size_t>(-1);

    int fetch(std::size_t index);

    std::size_t m_size = not_known;
    std::size_t m_fetched = not_known; // what m_name and m_data are of
    const char* m_name = nullptr;
    CMPIData m_data{};
};

class CMPIInstance_Container : public CMPI_Container {
public:
    CMPIInstance_Container(const CMPIBroker* broker, const Meta_Repository* repository, const char* name_space,
                           CMPIInstance* instance, unsigned depth = 0);
    int set_value(const char* name, const Value& value, uint32 flags, Kept_Text* kept) override;

private:
    std::size_t count() override;
    int read(std::size_t index, CMPIString*& name, CMPIData& data) override;
    CMPIInstance* m_instance;
};

class CMPIObjectPath_Container : public CMPI_Container {
public:
    CMPIObjectPath_Container(const CMPIBroker* broker, const Meta_Repository* repository, const char* name_space,
                             CMPIObjectPath* path, unsigned depth = 0);
    int set_value(const char* name, const Value& value, uint32 flags, Kept_Text* kept) override;

private:
    std::size_t count() override;
    int read(std::size_t index, CMPIString*& name, CMPIData& data) override;
    int take(CMPIData& data, int expected_type, Value& value) override;
    CMPIObjectPath* m_path;
};

class CMPIArgs_Container : public CMPI_Container {
public:
    CMPIArgs_Container(const CMPIBroker* broker, const Meta_Repository* repository, const char* name_space,
                       CMPIArgs* args, unsigned depth = 0);
    int set_value(const char* name, const Value& value, uint32 flags, Kept_Text* kept) override;

    /// What was set by the name "return_value", which is no argument; none otherwise.
    const Value& return_value() const { return m_return_value; }

private:
    std::size_t count() override;
    int read(std::size_t index, CMPIString*& name, CMPIData& data) override;
    int take(CMPIData& data, int expected_type, Value& value) override;
    CMPIArgs* m_args;
    Value m_return_value;
};

} // namespace cimple
