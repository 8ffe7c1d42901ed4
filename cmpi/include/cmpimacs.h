/* Convenience calls of CMPI: CMX(object, ...) calls slot X of the object's table, CBX(broker, context, ...) slot X of
 * the broker's, CMNewX a constructor of the broker's. They test nothing: where a slot or a table may be null, test it
 * first. */
#ifndef NORVANE_CMPIMACS_H
#define NORVANE_CMPIMACS_H

#include "cmpidt.h"
#include "cmpift.h"

#define CMReturn(code)                                                                                                 \
    do {                                                                                                               \
        CMPIStatus status_to_return = {(code), NULL};                                                                  \
        return status_to_return;                                                                                       \
    } while (0)

#define CMReturnWithChars(broker, code, text)                                                                          \
    do {                                                                                                               \
        CMPIStatus status_to_return = {(code), NULL};                                                                  \
        status_to_return.msg = (broker)->eft->newString((broker), (text), NULL);                                       \
        return status_to_return;                                                                                       \
    } while (0)

#define CMSetStatus(status, code)                                                                                      \
    do {                                                                                                               \
        (status)->rc = (code);                                                                                         \
        (status)->msg = NULL;                                                                                          \
    } while (0)

#define CMIsNullObject(object) ((object) == NULL)
#define CMIsNullValue(data) ((data).state & CMPI_nullValue)
#define CMIsArray(data) ((data).type & CMPI_ARRAY)

#define CMRelease(object) ((object)->ft->release((object)))
#define CMClone(object, rc) ((object)->ft->clone((object), (rc)))

/* Constructors and helpers of the broker. */
#define CMNewInstance(b, op, rc) ((b)->eft->newInstance((b), (op), (rc)))
#define CMNewObjectPath(b, ns, cn, rc) ((b)->eft->newObjectPath((b), (ns), (cn), (rc)))
#define CMNewArgs(b, rc) ((b)->eft->newArgs((b), (rc)))
#define CMNewString(b, data, rc) ((b)->eft->newString((b), (data), (rc)))
#define CMNewArray(b, max, type, rc) ((b)->eft->newArray((b), (max), (type), (rc)))
#define CMNewDateTime(b, rc) ((b)->eft->newDateTime((b), (rc)))
#define CMNewDateTimeFromBinary(b, binTime, interval, rc)                                                              \
    ((b)->eft->newDateTimeFromBinary((b), (binTime), (interval), (rc)))
#define CMNewDateTimeFromChars(b, utcTime, rc) ((b)->eft->newDateTimeFromChars((b), (utcTime), (rc)))
#define CMNewSelectExp(b, query, lang, projection, st)                                                                 \
    ((b)->eft->newSelectExp((b), (query), (lang), (projection), (st)))
#define CMClassPathIsA(b, op, type, rc) ((b)->eft->classPathIsA((b), (op), (type), (rc)))
#define CDToString(b, object, rc) ((b)->eft->toString((b), (object), (rc)))
#define CDIsOfType(b, object, type, rc) ((b)->eft->isOfType((b), (object), (type), (rc)))
#define CDGetType(b, object, rc) ((b)->eft->getType((b), (object), (rc)))
#define CMLogMessage(b, severity, id, text, string) ((b)->eft->logMessage((b), (severity), (id), (text), (string)))
#define CMTrace(b, level, component, text, string) ((b)->eft->trace((b), (level), (component), (text), (string)))
#define CMOpenMessageFile(b, msgFile, msgFileHandle) ((b)->eft->openMessageFile((b), (msgFile), (msgFileHandle)))
#define CMCloseMessageFile(b, msgFileHandle) ((b)->eft->closeMessageFile((b), (msgFileHandle)))
#define CMNewCMPIError(b, owner, id, text, severity, cause, code, rc)                                                  \
    ((b)->eft->newCMPIError((b), (owner), (id), (text), (severity), (cause), (code), (rc)))

/* Services of the broker. */
#define CBPrepareAttachThread(b, ctx) ((b)->bft->prepareAttachThread((b), (ctx)))
#define CBAttachThread(b, ctx) ((b)->bft->attachThread((b), (ctx)))
#define CBDetachThread(b, ctx) ((b)->bft->detachThread((b), (ctx)))
#define CBDeliverIndication(b, ctx, ns, ind) ((b)->bft->deliverIndication((b), (ctx), (ns), (ind)))
#define CBEnumInstanceNames(b, ctx, op, rc) ((b)->bft->enumerateInstanceNames((b), (ctx), (op), (rc)))
#define CBGetInstance(b, ctx, op, properties, rc) ((b)->bft->getInstance((b), (ctx), (op), (properties), (rc)))
#define CBCreateInstance(b, ctx, op, inst, rc) ((b)->bft->createInstance((b), (ctx), (op), (inst), (rc)))
#define CBModifyInstance(b, ctx, op, inst, properties)                                                                 \
    ((b)->bft->modifyInstance((b), (ctx), (op), (inst), (properties)))
#define CBDeleteInstance(b, ctx, op) ((b)->bft->deleteInstance((b), (ctx), (op)))
#define CBExecQuery(b, ctx, op, query, lang, rc) ((b)->bft->execQuery((b), (ctx), (op), (query), (lang), (rc)))
#define CBEnumInstances(b, ctx, op, properties, rc) ((b)->bft->enumerateInstances((b), (ctx), (op), (properties), (rc)))
#define CBAssociators(b, ctx, op, assocClass, resultClass, role, resultRole, properties, rc)                           \
    ((b)->bft->associators((b), (ctx), (op), (assocClass), (resultClass), (role), (resultRole), (properties), (rc)))
#define CBAssociatorNames(b, ctx, op, assocClass, resultClass, role, resultRole, rc)                                   \
    ((b)->bft->associatorNames((b), (ctx), (op), (assocClass), (resultClass), (role), (resultRole), (rc)))
#define CBReferences(b, ctx, op, resultClass, role, properties, rc)                                                    \
    ((b)->bft->references((b), (ctx), (op), (resultClass), (role), (properties), (rc)))
#define CBReferenceNames(b, ctx, op, resultClass, role, rc)                                                            \
    ((b)->bft->referenceNames((b), (ctx), (op), (resultClass), (role), (rc)))
#define CBInvokeMethod(b, ctx, op, method, in, out, rc)                                                                \
    ((b)->bft->invokeMethod((b), (ctx), (op), (method), (in), (out), (rc)))
#define CBSetProperty(b, ctx, op, name, value, type)                                                                   \
    ((b)->bft->setProperty((b), (ctx), (op), (name), (const CMPIValue*)(value), (type)))
#define CBGetProperty(b, ctx, op, name, rc) ((b)->bft->getProperty((b), (ctx), (op), (name), (rc)))

/* Strings and date-times. */
#define CMGetCharsPtr(o, rc) ((o)->ft->getCharPtr((o), (rc)))
#define CMGetBinaryFormat(o, rc) ((o)->ft->getBinaryFormat((o), (rc)))
#define CMGetStringFormat(o, rc) ((o)->ft->getStringFormat((o), (rc)))
#define CMIsInterval(o, rc) ((o)->ft->isInterval((o), (rc)))

/* Arrays and enumerations. */
#define CMGetArrayCount(o, rc) ((o)->ft->getSize((o), (rc)))
#define CMGetArrayType(o, rc) ((o)->ft->getSimpleType((o), (rc)))
#define CMGetArrayElementAt(o, index, rc) ((o)->ft->getElementAt((o), (index), (rc)))
#define CMSetArrayElementAt(o, index, value, type)                                                                     \
    ((o)->ft->setElementAt((o), (index), (const CMPIValue*)(value), (type)))
#define CMGetNext(o, rc) ((o)->ft->getNext((o), (rc)))
#define CMHasNext(o, rc) ((o)->ft->hasNext((o), (rc)))
#define CMToArray(o, rc) ((o)->ft->toArray((o), (rc)))

/* Instances. */
#define CMGetProperty(o, name, rc) ((o)->ft->getProperty((o), (name), (rc)))
#define CMGetPropertyAt(o, index, name, rc) ((o)->ft->getPropertyAt((o), (index), (name), (rc)))
#define CMGetPropertyCount(o, rc) ((o)->ft->getPropertyCount((o), (rc)))
#define CMSetProperty(o, name, value, type) ((o)->ft->setProperty((o), (name), (const CMPIValue*)(value), (type)))
#define CMGetObjectPath(o, rc) ((o)->ft->getObjectPath((o), (rc)))
#define CMSetPropertyFilter(o, propertyList, keys) ((o)->ft->setPropertyFilter((o), (propertyList), (keys)))
#define CMSetObjectPath(o, op) ((o)->ft->setObjectPath((o), (op)))
#define CMSetPropertyWithOrigin(o, name, value, type, origin)                                                          \
    ((o)->ft->setPropertyWithOrigin((o), (name), (const CMPIValue*)(value), (type), (origin)))

/* Object paths. */
#define CMSetNameSpace(o, ns) ((o)->ft->setNameSpace((o), (ns)))
#define CMGetNameSpace(o, rc) ((o)->ft->getNameSpace((o), (rc)))
#define CMSetHostname(o, hn) ((o)->ft->setHostname((o), (hn)))
#define CMGetHostname(o, rc) ((o)->ft->getHostname((o), (rc)))
#define CMSetClassName(o, cn) ((o)->ft->setClassName((o), (cn)))
#define CMGetClassName(o, rc) ((o)->ft->getClassName((o), (rc)))
#define CMAddKey(o, name, value, type) ((o)->ft->addKey((o), (name), (const CMPIValue*)(value), (type)))
#define CMGetKey(o, name, rc) ((o)->ft->getKey((o), (name), (rc)))
#define CMGetKeyAt(o, index, name, rc) ((o)->ft->getKeyAt((o), (index), (name), (rc)))
#define CMGetKeyCount(o, rc) ((o)->ft->getKeyCount((o), (rc)))
#define CMSetNameSpaceFromObjectPath(o, src) ((o)->ft->setNameSpaceFromObjectPath((o), (src)))
#define CMSetHostAndNameSpaceFromObjectPath(o, src) ((o)->ft->setHostAndNameSpaceFromObjectPath((o), (src)))
#define CMGetClassQualifier(o, qName, rc) ((o)->ft->getClassQualifier((o), (qName), (rc)))
#define CMGetPropertyQualifier(o, pName, qName, rc) ((o)->ft->getPropertyQualifier((o), (pName), (qName), (rc)))
#define CMGetMethodQualifier(o, methodName, qName, rc) ((o)->ft->getMethodQualifier((o), (methodName), (qName), (rc)))
#define CMGetParameterQualifier(o, mName, pName, qName, rc)                                                            \
    ((o)->ft->getParameterQualifier((o), (mName), (pName), (qName), (rc)))
#define CMObjectPathToString(o, rc) ((o)->ft->toString((o), (rc)))

/* Arguments. */
#define CMAddArg(o, name, value, type) ((o)->ft->addArg((o), (name), (const CMPIValue*)(value), (type)))
#define CMGetArg(o, name, rc) ((o)->ft->getArg((o), (name), (rc)))
#define CMGetArgAt(o, index, name, rc) ((o)->ft->getArgAt((o), (index), (name), (rc)))
#define CMGetArgCount(o, rc) ((o)->ft->getArgCount((o), (rc)))

/* Contexts. */
#define CMGetContextEntry(o, name, rc) ((o)->ft->getEntry((o), (name), (rc)))
#define CMGetContextEntryAt(o, index, name, rc) ((o)->ft->getEntryAt((o), (index), (name), (rc)))
#define CMGetContextEntryCount(o, rc) ((o)->ft->getEntryCount((o), (rc)))
#define CMAddContextEntry(o, name, value, type) ((o)->ft->addEntry((o), (name), (const CMPIValue*)(value), (type)))

/* Results. */
#define CMReturnData(o, value, type) ((o)->ft->returnData((o), (const CMPIValue*)(value), (type)))
#define CMReturnInstance(o, inst) ((o)->ft->returnInstance((o), (inst)))
#define CMReturnObjectPath(o, ref) ((o)->ft->returnObjectPath((o), (ref)))
#define CMReturnDone(o) ((o)->ft->returnDone((o)))
#define CMReturnError(o, er) ((o)->ft->returnError((o), (er)))

/* Filters. */
#define CMEvaluateSelExp(o, inst, rc) ((o)->ft->evaluate((o), (inst), (rc)))
#define CMGetSelExpString(o, rc) ((o)->ft->getString((o), (rc)))

#endif
