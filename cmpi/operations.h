/// The functions behind the slots of the four MI tables, as the CMPI standard declares them.
#pragma once

#include <cmpift.h>

namespace cimple {

struct MI_Table_Set;

// Instances.
CMPIStatus enumerateInstanceNames(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                                  const CMPIObjectPath* op);
CMPIStatus enumerateInstances(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                              const CMPIObjectPath* op, const char** properties);
CMPIStatus getInstance(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op,
                       const char** properties);
CMPIStatus createInstance(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op,
                          const CMPIInstance* inst);
CMPIStatus modifyInstance(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op,
                          const CMPIInstance* inst, const char** properties);
CMPIStatus deleteInstance(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op);
CMPIStatus execQuery(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op,
                     const char* query, const char* lang);

// Methods.
CMPIStatus invokeMethod(CMPIMethodMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op,
                        const char* method, const CMPIArgs* in, CMPIArgs* out);

// Associations.
CMPIStatus associators(CMPIAssociationMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op,
                       const char* assocClass, const char* resultClass, const char* role, const char* resultRole,
                       const char** properties);
CMPIStatus associatorNames(CMPIAssociationMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                           const CMPIObjectPath* op, const char* assocClass, const char* resultClass, const char* role,
                           const char* resultRole);
CMPIStatus references(CMPIAssociationMI* mi, const CMPIContext* ctx, const CMPIResult* rslt, const CMPIObjectPath* op,
                      const char* assocClass, const char* role, const char** properties);
CMPIStatus referenceNames(CMPIAssociationMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                          const CMPIObjectPath* op, const char* assocClass, const char* role);

// Indications.
CMPIStatus authorizeFilter(CMPIIndicationMI* mi, const CMPIContext* ctx, const CMPISelectExp* filter,
                           const char* className, const CMPIObjectPath* op, const char* owner);
CMPIStatus mustPoll(CMPIIndicationMI* mi, const CMPIContext* ctx, const CMPISelectExp* filter, const char* className,
                    const CMPIObjectPath* op);
CMPIStatus activateFilter(CMPIIndicationMI* mi, const CMPIContext* ctx, const CMPISelectExp* filter,
                          const char* className, const CMPIObjectPath* op, CMPIBoolean firstActivation);
CMPIStatus deActivateFilter(CMPIIndicationMI* mi, const CMPIContext* ctx, const CMPISelectExp* filter,
                            const char* className, const CMPIObjectPath* op, CMPIBoolean lastActivation);
CMPIStatus enableIndications(CMPIIndicationMI* mi, const CMPIContext* ctx);
CMPIStatus disableIndications(CMPIIndicationMI* mi, const CMPIContext* ctx);

// Clean-up, of any kind of MI.
CMPIStatus instanceCleanup(CMPIInstanceMI* mi, const CMPIContext* ctx, CMPIBoolean terminating);
CMPIStatus methodCleanup(CMPIMethodMI* mi, const CMPIContext* ctx, CMPIBoolean terminating);
CMPIStatus associationCleanup(CMPIAssociationMI* mi, const CMPIContext* ctx, CMPIBoolean terminating);
CMPIStatus indicationCleanup(CMPIIndicationMI* mi, const CMPIContext* ctx, CMPIBoolean terminating);

} // namespace cimple
