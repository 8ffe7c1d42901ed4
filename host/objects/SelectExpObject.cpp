#include "host/objects/SelectExpObject.h"

#include "host/Broker.h"

namespace host {
namespace {

CMPISelectExp* clone(const CMPISelectExp* self, CMPIStatus* status)
{
    auto* object = unwrap<Select_Exp_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? &object->broker.make<Select_Exp_Object>(Origin::cloned, object->query, object->language)->face
                  : nullptr;
}

CMPIBoolean evaluate(const CMPISelectExp* self, const CMPIInstance*, CMPIStatus* status)
{
    auto* object = unwrap<Select_Exp_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? CMPI_true : CMPI_false;
}

CMPIBoolean evaluate_using_accessor(const CMPISelectExp* self, CMPIAccessor*, void*, CMPIStatus* status)
{
    return evaluate(self, nullptr, status);
}

CMPIString* get_string(const CMPISelectExp* self, CMPIStatus* status)
{
    auto* object = unwrap<Select_Exp_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? object->broker.make_string(Origin::got, object->query) : nullptr;
}

CMPISelectCond* no_condition(const CMPISelectExp*, CMPIStatus* status)
{
    put_status(status, CMPI_RC_ERR_NOT_SUPPORTED);
    return nullptr;
}

} // namespace

CMPISelectExpFT Select_Exp_Object::table(const Manner& manner)
{
    CMPISelectExpFT ft{};
    ft.ftVersion = manner.object_version;
    ft.release = release_face<Select_Exp_Object, CMPISelectExp>;
    ft.clone = clone;
    ft.evaluate = evaluate;
    ft.getString = get_string;
    ft.getDOC = no_condition;
    ft.getCOD = no_condition;
    ft.evaluateUsingAccessor = evaluate_using_accessor;
    return ft;
}

Select_Exp_Object::Select_Exp_Object(Broker& owner, Origin from, std::string text, std::string lang)
    : Object(owner, object_kind, from), face{static_cast<Object*>(this), &owner.tables().select_exp},
      query(std::move(text)), language(std::move(lang))
{
}

} // namespace host
