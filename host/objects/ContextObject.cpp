#include "host/objects/ContextObject.h"

#include "host/Broker.h"
#include "host/Convert.h"

namespace host {
namespace {

CMPIStatus release(CMPIContext* self)
{
    auto* object = unwrap<Context_Object>(self);
    bool prepared = object && object->prepared;
    Ledger* ledger = prepared ? &object->broker.ledger() : nullptr;
    CMPIStatus status = release_face<Context_Object>(self);
    if (ledger && status.rc == CMPI_RC_OK) ledger->context_out(-1);
    return status;
}

CMPIContext* clone(const CMPIContext* self, CMPIStatus* status)
{
    auto* object = unwrap<Context_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? &object->broker.make<Context_Object>(Origin::cloned, object->entries)->face : nullptr;
}

CMPIData data_of_entry(Context_Object& object, const Context_Object::Entry& entry)
{
    if (!entry.null_characters) return data_of(object.broker, entry.value, Origin::got);
    CMPIData data{};
    data.type = CMPI_string;
    data.value.string = &object.broker.make<String_Object>(Origin::got, std::nullopt)->face;
    return data;
}

CMPIData get_entry(const CMPIContext* self, const char* name, CMPIStatus* status)
{
    auto* object = unwrap<Context_Object>(self);
    if (!object || !name)
        return no_data(status, object ? CMPI_RC_ERR_INVALID_PARAMETER : CMPI_RC_ERR_INVALID_HANDLE, CMPI_badValue);
    const Context_Object::Entry* entry = object->find(name);
    if (!entry) return no_data(status, CMPI_RC_ERR_NOT_FOUND, object->broker.manner().not_found_state);
    put_status(status, CMPI_RC_OK);
    return data_of_entry(*object, *entry);
}

CMPIData get_entry_at(const CMPIContext* self, CMPICount index, CMPIString** name, CMPIStatus* status)
{
    auto* object = unwrap<Context_Object>(self);
    if (!object) return no_data(status, CMPI_RC_ERR_INVALID_HANDLE, CMPI_badValue);
    if (index >= object->entries.size())
        return no_data(status, CMPI_RC_ERR_NO_SUCH_PROPERTY, object->broker.manner().not_found_state);
    if (name) *name = object->broker.make_string(Origin::got, object->entries[index].name);
    put_status(status, CMPI_RC_OK);
    return data_of_entry(*object, object->entries[index]);
}

CMPICount get_entry_count(const CMPIContext* self, CMPIStatus* status)
{
    auto* object = unwrap<Context_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? static_cast<CMPICount>(object->entries.size()) : 0;
}

CMPIStatus add_entry(const CMPIContext* self, const char* name, const CMPIValue* value, const CMPIType type)
{
    auto* object = unwrap<Context_Object>(self);
    if (!object) return status_of(CMPI_RC_ERR_INVALID_HANDLE);
    if (!name || !*name) return status_of(CMPI_RC_ERR_INVALID_PARAMETER);
    int code = CMPI_RC_OK;
    Value taken = value_of(value, type, code);
    if (code != CMPI_RC_OK) return status_of(code);
    for (Context_Object::Entry& entry : object->entries)
        if (same_name(entry.name.c_str(), name)) {
            entry = {name, std::move(taken), false};
            return status_of(CMPI_RC_OK);
        }
    object->entries.push_back({name, std::move(taken), false});
    return status_of(CMPI_RC_OK);
}

} // namespace

CMPIContextFT Context_Object::table(const Manner& manner)
{
    CMPIContextFT ft{};
    ft.ftVersion = manner.object_version;
    ft.release = release;
    if (!manner.result_life_absent) ft.clone = clone;
    ft.getEntry = get_entry;
    ft.getEntryAt = get_entry_at;
    ft.getEntryCount = get_entry_count;
    ft.addEntry = add_entry;
    return ft;
}

Context_Object::Context_Object(Broker& owner, Origin from, std::vector<Entry> content)
    : Object(owner, object_kind, from), face{static_cast<Object*>(this), &owner.tables().context},
      entries(std::move(content))
{
}

const Context_Object::Entry* Context_Object::find(const char* name) const
{
    for (const Entry& entry : entries)
        if (same_name(entry.name.c_str(), name)) return &entry;
    return nullptr;
}

std::string Context_Object::to_text() const
{
    std::string text;
    for (const Entry& entry : entries)
        text += (text.empty() ? "" : ", ") + entry.name + "=" + entry.value.to_text();
    return text;
}

} // namespace host
