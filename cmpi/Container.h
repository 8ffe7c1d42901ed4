/// A numbered list of named values: the one face that CMPI instances, object paths and argument lists show to the two
/// algorithms which walk an Instance against them.
///
/// A container looks at a CMPI object and owns nothing of it; it lives on the stack for one conversion.
#pragma once

#include <vector>

#include "cmpi/Value.h"
#include "cmpi/cmpi_data.h"

namespace cimple {

/// The features of a class that the instances of one answer have converted, and what their values have in common: found
/// once, and again where the class changes.
class Feature_List {
public:
    struct Entry {
        const Meta_Feature* feature;
        Kept_Text kept;
    };

    /// All features but methods whose flags meet `flag_mask` (0: all).
    explicit Feature_List(uint32 flag_mask) : m_flag_mask(flag_mask) {}
    std::vector<Entry>& of(const Meta_Record* record);

private:
    const uint32 m_flag_mask;
    const Meta_Record* m_record = nullptr;
    std::vector<Entry> m_entries;
};

class Container {
public:
    /// `repository`: where classes of references and embedded instances are looked up. `depth`: how many instances this
    /// one is embedded in.
    Container(const Meta_Repository* repository, unsigned depth) : m_repository(repository), m_depth(depth) {}
    Container(const Container&) = delete;
    Container& operator=(const Container&) = delete;
    virtual ~Container() = default;

    virtual std::size_t get_size() = 0;
    /// The name at `index`, valid until the next call. 0 on success.
    virtual int get_name(std::size_t index, const char*& name) = 0;
    /// The value at `index`, which the caller wants with the tag `expected_type`. 0 on success.
    virtual int get_value(std::size_t index, int expected_type, Value& value) = 0;
    /// Adds or sets a value; `flags` are those of the feature, `kept` as for to_cmpi_data. 0 on success.
    virtual int set_value(const char* name, const Value& value, uint32 flags, Kept_Text* kept) = 0;

    /// Instance to container: all features but methods that meet `flag_mask` (0: all) and are not null. A feature that
    /// cannot be converted is logged and left out. 0, or -1 without an instance.
    int convert(const Instance* instance, uint32 flag_mask);
    /// The same for one of many instances.
    int convert(const Instance* instance, Feature_List& features);

    /// Container to instance: every name in the container that `record` has, with flags that meet `flag_mask` (0: all).
    /// `instance` is the record to fill, all null first; null: made of `record`, which must be a class then. What does
    /// not fit is logged and left null. Always 0.
    int convert(const Meta_Record* record, uint32 flag_mask, Instance*& instance);

private:
    void convert_feature(const Instance* instance, const Meta_Feature* feature, Value& value, Kept_Text* kept);

protected:
    const Meta_Repository* m_repository;
    unsigned m_depth;
};

} // namespace cimple
