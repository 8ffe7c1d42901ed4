// The CMPI declarations: where every slot lies is the binary interface that servers were built against.
#include <cmpift.h>
#include <cmpimacs.h>
#include <cmpios.h>

#include <cstddef>
#include <gtest/gtest.h>

namespace {
constexpr size_t word = sizeof(void*);

// Most tables start with one int, padded to a word; broker and provider tables start with two, side by side.
constexpr size_t one_int_head(size_t index)
{
    return index * word;
}

constexpr size_t two_int_head(size_t index)
{
    return index < 2 ? index * sizeof(int) : (index - 1) * word;
}
} // namespace

#define SLOT(table, name, index) static_assert(offsetof(table, name) == one_int_head(index))
#define TWO_WORD_HEAD(table, name, index) static_assert(offsetof(table, name) == two_int_head(index))

SLOT(CMPIBrokerEncFT, ftVersion, 0);
SLOT(CMPIBrokerEncFT, newInstance, 1);
SLOT(CMPIBrokerEncFT, newObjectPath, 2);
SLOT(CMPIBrokerEncFT, newArgs, 3);
SLOT(CMPIBrokerEncFT, newString, 4);
SLOT(CMPIBrokerEncFT, newArray, 5);
SLOT(CMPIBrokerEncFT, newDateTime, 6);
SLOT(CMPIBrokerEncFT, newDateTimeFromBinary, 7);
SLOT(CMPIBrokerEncFT, newDateTimeFromChars, 8);
SLOT(CMPIBrokerEncFT, newSelectExp, 9);
SLOT(CMPIBrokerEncFT, classPathIsA, 10);
SLOT(CMPIBrokerEncFT, toString, 11);
SLOT(CMPIBrokerEncFT, isOfType, 12);
SLOT(CMPIBrokerEncFT, getType, 13);
SLOT(CMPIBrokerEncFT, getMessage, 14);
SLOT(CMPIBrokerEncFT, logMessage, 15);
SLOT(CMPIBrokerEncFT, trace, 16);
SLOT(CMPIBrokerEncFT, newCMPIError, 17);
SLOT(CMPIBrokerEncFT, openMessageFile, 18);
SLOT(CMPIBrokerEncFT, closeMessageFile, 19);
SLOT(CMPIBrokerEncFT, getMessage2, 20);

TWO_WORD_HEAD(CMPIBrokerFT, brokerCapabilities, 0);
TWO_WORD_HEAD(CMPIBrokerFT, brokerVersion, 1);
TWO_WORD_HEAD(CMPIBrokerFT, brokerName, 2);
TWO_WORD_HEAD(CMPIBrokerFT, prepareAttachThread, 3);
TWO_WORD_HEAD(CMPIBrokerFT, attachThread, 4);
TWO_WORD_HEAD(CMPIBrokerFT, detachThread, 5);
TWO_WORD_HEAD(CMPIBrokerFT, deliverIndication, 6);
TWO_WORD_HEAD(CMPIBrokerFT, enumerateInstanceNames, 7);
TWO_WORD_HEAD(CMPIBrokerFT, getInstance, 8);
TWO_WORD_HEAD(CMPIBrokerFT, createInstance, 9);
TWO_WORD_HEAD(CMPIBrokerFT, modifyInstance, 10);
TWO_WORD_HEAD(CMPIBrokerFT, deleteInstance, 11);
TWO_WORD_HEAD(CMPIBrokerFT, execQuery, 12);
TWO_WORD_HEAD(CMPIBrokerFT, enumerateInstances, 13);
TWO_WORD_HEAD(CMPIBrokerFT, associators, 14);
TWO_WORD_HEAD(CMPIBrokerFT, associatorNames, 15);
TWO_WORD_HEAD(CMPIBrokerFT, references, 16);
TWO_WORD_HEAD(CMPIBrokerFT, referenceNames, 17);
TWO_WORD_HEAD(CMPIBrokerFT, invokeMethod, 18);
TWO_WORD_HEAD(CMPIBrokerFT, setProperty, 19);
TWO_WORD_HEAD(CMPIBrokerFT, getProperty, 20);

SLOT(CMPIBrokerExtFT, ftVersion, 0);
SLOT(CMPIBrokerExtFT, resolveFileName, 1);
SLOT(CMPIBrokerExtFT, newThread, 2);
SLOT(CMPIBrokerExtFT, joinThread, 3);
SLOT(CMPIBrokerExtFT, exitThread, 4);
SLOT(CMPIBrokerExtFT, cancelThread, 5);
SLOT(CMPIBrokerExtFT, threadSleep, 6);
SLOT(CMPIBrokerExtFT, threadOnce, 7);
SLOT(CMPIBrokerExtFT, createThreadKey, 8);
SLOT(CMPIBrokerExtFT, destroyThreadKey, 9);
SLOT(CMPIBrokerExtFT, getThreadSpecific, 10);
SLOT(CMPIBrokerExtFT, setThreadSpecific, 11);
SLOT(CMPIBrokerExtFT, newMutex, 12);
SLOT(CMPIBrokerExtFT, destroyMutex, 13);
SLOT(CMPIBrokerExtFT, lockMutex, 14);
SLOT(CMPIBrokerExtFT, unlockMutex, 15);
SLOT(CMPIBrokerExtFT, newCondition, 16);
SLOT(CMPIBrokerExtFT, destroyCondition, 17);
SLOT(CMPIBrokerExtFT, condWait, 18);
SLOT(CMPIBrokerExtFT, timedCondWait, 19);
SLOT(CMPIBrokerExtFT, signalCondition, 20);

SLOT(CMPIBrokerMemFT, ftVersion, 0);
SLOT(CMPIBrokerMemFT, mark, 1);
SLOT(CMPIBrokerMemFT, release, 2);
SLOT(CMPIBrokerMemFT, cmpiMalloc, 3);
SLOT(CMPIBrokerMemFT, cmpiCalloc, 4);
SLOT(CMPIBrokerMemFT, cmpiRealloc, 5);
SLOT(CMPIBrokerMemFT, cmpiStrDup, 6);
SLOT(CMPIBrokerMemFT, cmpiFree, 7);
SLOT(CMPIBrokerMemFT, freeInstance, 8);
SLOT(CMPIBrokerMemFT, freeObjectPath, 9);
SLOT(CMPIBrokerMemFT, freeArgs, 10);
SLOT(CMPIBrokerMemFT, freeString, 11);
SLOT(CMPIBrokerMemFT, freeArray, 12);
SLOT(CMPIBrokerMemFT, freeDateTime, 13);
SLOT(CMPIBrokerMemFT, freeSelectExp, 14);

SLOT(CMPIContextFT, ftVersion, 0);
SLOT(CMPIContextFT, release, 1);
SLOT(CMPIContextFT, clone, 2);
SLOT(CMPIContextFT, getEntry, 3);
SLOT(CMPIContextFT, getEntryAt, 4);
SLOT(CMPIContextFT, getEntryCount, 5);
SLOT(CMPIContextFT, addEntry, 6);

SLOT(CMPIResultFT, ftVersion, 0);
SLOT(CMPIResultFT, release, 1);
SLOT(CMPIResultFT, clone, 2);
SLOT(CMPIResultFT, returnData, 3);
SLOT(CMPIResultFT, returnInstance, 4);
SLOT(CMPIResultFT, returnObjectPath, 5);
SLOT(CMPIResultFT, returnDone, 6);
SLOT(CMPIResultFT, returnError, 7);

SLOT(CMPIErrorFT, ftVersion, 0);
SLOT(CMPIErrorFT, release, 1);
SLOT(CMPIErrorFT, clone, 2);
SLOT(CMPIErrorFT, getErrorType, 3);
SLOT(CMPIErrorFT, getOtherErrorType, 4);
SLOT(CMPIErrorFT, getOwningEntity, 5);
SLOT(CMPIErrorFT, getMessageID, 6);
SLOT(CMPIErrorFT, getMessage, 7);
SLOT(CMPIErrorFT, getPerceivedSeverity, 8);
SLOT(CMPIErrorFT, getProbableCause, 9);
SLOT(CMPIErrorFT, getProbableCauseDescription, 10);
SLOT(CMPIErrorFT, getRecommendedActions, 11);
SLOT(CMPIErrorFT, getErrorSource, 12);
SLOT(CMPIErrorFT, getErrorSourceFormat, 13);
SLOT(CMPIErrorFT, getOtherErrorSourceFormat, 14);
SLOT(CMPIErrorFT, getCIMStatusCode, 15);
SLOT(CMPIErrorFT, getCIMStatusCodeDescription, 16);
SLOT(CMPIErrorFT, getMessageArguments, 17);
SLOT(CMPIErrorFT, setErrorType, 18);
SLOT(CMPIErrorFT, setOtherErrorType, 19);
SLOT(CMPIErrorFT, setProbableCauseDescription, 20);
SLOT(CMPIErrorFT, setRecommendedActions, 21);
SLOT(CMPIErrorFT, setErrorSource, 22);
SLOT(CMPIErrorFT, setErrorSourceFormat, 23);
SLOT(CMPIErrorFT, setOtherErrorSourceFormat, 24);
SLOT(CMPIErrorFT, setCIMStatusCodeDescription, 25);
SLOT(CMPIErrorFT, setMessageArguments, 26);

SLOT(CMPIInstanceFT, ftVersion, 0);
SLOT(CMPIInstanceFT, release, 1);
SLOT(CMPIInstanceFT, clone, 2);
SLOT(CMPIInstanceFT, getProperty, 3);
SLOT(CMPIInstanceFT, getPropertyAt, 4);
SLOT(CMPIInstanceFT, getPropertyCount, 5);
SLOT(CMPIInstanceFT, setProperty, 6);
SLOT(CMPIInstanceFT, getObjectPath, 7);
SLOT(CMPIInstanceFT, setPropertyFilter, 8);
SLOT(CMPIInstanceFT, setObjectPath, 9);
SLOT(CMPIInstanceFT, setPropertyWithOrigin, 10);

SLOT(CMPIObjectPathFT, ftVersion, 0);
SLOT(CMPIObjectPathFT, release, 1);
SLOT(CMPIObjectPathFT, clone, 2);
SLOT(CMPIObjectPathFT, setNameSpace, 3);
SLOT(CMPIObjectPathFT, getNameSpace, 4);
SLOT(CMPIObjectPathFT, setHostname, 5);
SLOT(CMPIObjectPathFT, getHostname, 6);
SLOT(CMPIObjectPathFT, setClassName, 7);
SLOT(CMPIObjectPathFT, getClassName, 8);
SLOT(CMPIObjectPathFT, addKey, 9);
SLOT(CMPIObjectPathFT, getKey, 10);
SLOT(CMPIObjectPathFT, getKeyAt, 11);
SLOT(CMPIObjectPathFT, getKeyCount, 12);
SLOT(CMPIObjectPathFT, setNameSpaceFromObjectPath, 13);
SLOT(CMPIObjectPathFT, setHostAndNameSpaceFromObjectPath, 14);
SLOT(CMPIObjectPathFT, getClassQualifier, 15);
SLOT(CMPIObjectPathFT, getPropertyQualifier, 16);
SLOT(CMPIObjectPathFT, getMethodQualifier, 17);
SLOT(CMPIObjectPathFT, getParameterQualifier, 18);
SLOT(CMPIObjectPathFT, toString, 19);

SLOT(CMPISelectExpFT, ftVersion, 0);
SLOT(CMPISelectExpFT, release, 1);
SLOT(CMPISelectExpFT, clone, 2);
SLOT(CMPISelectExpFT, evaluate, 3);
SLOT(CMPISelectExpFT, getString, 4);
SLOT(CMPISelectExpFT, getDOC, 5);
SLOT(CMPISelectExpFT, getCOD, 6);
SLOT(CMPISelectExpFT, evaluateUsingAccessor, 7);

SLOT(CMPISelectCondFT, ftVersion, 0);
SLOT(CMPISelectCondFT, release, 1);
SLOT(CMPISelectCondFT, clone, 2);
SLOT(CMPISelectCondFT, getCountAndType, 3);
SLOT(CMPISelectCondFT, getSubCondAt, 4);

SLOT(CMPISubCondFT, ftVersion, 0);
SLOT(CMPISubCondFT, release, 1);
SLOT(CMPISubCondFT, clone, 2);
SLOT(CMPISubCondFT, getCount, 3);
SLOT(CMPISubCondFT, getPredicateAt, 4);
SLOT(CMPISubCondFT, getPredicate, 5);

SLOT(CMPIPredicateFT, ftVersion, 0);
SLOT(CMPIPredicateFT, release, 1);
SLOT(CMPIPredicateFT, clone, 2);
SLOT(CMPIPredicateFT, getData, 3);
SLOT(CMPIPredicateFT, evaluateUsingAccessor, 4);

SLOT(CMPIArgsFT, ftVersion, 0);
SLOT(CMPIArgsFT, release, 1);
SLOT(CMPIArgsFT, clone, 2);
SLOT(CMPIArgsFT, addArg, 3);
SLOT(CMPIArgsFT, getArg, 4);
SLOT(CMPIArgsFT, getArgAt, 5);
SLOT(CMPIArgsFT, getArgCount, 6);

SLOT(CMPIStringFT, ftVersion, 0);
SLOT(CMPIStringFT, release, 1);
SLOT(CMPIStringFT, clone, 2);
SLOT(CMPIStringFT, getCharPtr, 3);

SLOT(CMPIArrayFT, ftVersion, 0);
SLOT(CMPIArrayFT, release, 1);
SLOT(CMPIArrayFT, clone, 2);
SLOT(CMPIArrayFT, getSize, 3);
SLOT(CMPIArrayFT, getSimpleType, 4);
SLOT(CMPIArrayFT, getElementAt, 5);
SLOT(CMPIArrayFT, setElementAt, 6);

SLOT(CMPIEnumerationFT, ftVersion, 0);
SLOT(CMPIEnumerationFT, release, 1);
SLOT(CMPIEnumerationFT, clone, 2);
SLOT(CMPIEnumerationFT, getNext, 3);
SLOT(CMPIEnumerationFT, hasNext, 4);
SLOT(CMPIEnumerationFT, toArray, 5);

SLOT(CMPIDateTimeFT, ftVersion, 0);
SLOT(CMPIDateTimeFT, release, 1);
SLOT(CMPIDateTimeFT, clone, 2);
SLOT(CMPIDateTimeFT, getBinaryFormat, 3);
SLOT(CMPIDateTimeFT, getStringFormat, 4);
SLOT(CMPIDateTimeFT, isInterval, 5);

TWO_WORD_HEAD(CMPIInstanceMIFT, ftVersion, 0);
TWO_WORD_HEAD(CMPIInstanceMIFT, miVersion, 1);
TWO_WORD_HEAD(CMPIInstanceMIFT, miName, 2);
TWO_WORD_HEAD(CMPIInstanceMIFT, cleanup, 3);
TWO_WORD_HEAD(CMPIInstanceMIFT, enumerateInstanceNames, 4);
TWO_WORD_HEAD(CMPIInstanceMIFT, enumerateInstances, 5);
TWO_WORD_HEAD(CMPIInstanceMIFT, getInstance, 6);
TWO_WORD_HEAD(CMPIInstanceMIFT, createInstance, 7);
TWO_WORD_HEAD(CMPIInstanceMIFT, modifyInstance, 8);
TWO_WORD_HEAD(CMPIInstanceMIFT, deleteInstance, 9);
TWO_WORD_HEAD(CMPIInstanceMIFT, execQuery, 10);

TWO_WORD_HEAD(CMPIAssociationMIFT, ftVersion, 0);
TWO_WORD_HEAD(CMPIAssociationMIFT, miVersion, 1);
TWO_WORD_HEAD(CMPIAssociationMIFT, miName, 2);
TWO_WORD_HEAD(CMPIAssociationMIFT, cleanup, 3);
TWO_WORD_HEAD(CMPIAssociationMIFT, associators, 4);
TWO_WORD_HEAD(CMPIAssociationMIFT, associatorNames, 5);
TWO_WORD_HEAD(CMPIAssociationMIFT, references, 6);
TWO_WORD_HEAD(CMPIAssociationMIFT, referenceNames, 7);

TWO_WORD_HEAD(CMPIMethodMIFT, ftVersion, 0);
TWO_WORD_HEAD(CMPIMethodMIFT, miVersion, 1);
TWO_WORD_HEAD(CMPIMethodMIFT, miName, 2);
TWO_WORD_HEAD(CMPIMethodMIFT, cleanup, 3);
TWO_WORD_HEAD(CMPIMethodMIFT, invokeMethod, 4);

TWO_WORD_HEAD(CMPIPropertyMIFT, ftVersion, 0);
TWO_WORD_HEAD(CMPIPropertyMIFT, miVersion, 1);
TWO_WORD_HEAD(CMPIPropertyMIFT, miName, 2);
TWO_WORD_HEAD(CMPIPropertyMIFT, cleanup, 3);
TWO_WORD_HEAD(CMPIPropertyMIFT, setProperty, 4);
TWO_WORD_HEAD(CMPIPropertyMIFT, getProperty, 5);
TWO_WORD_HEAD(CMPIPropertyMIFT, setPropertyWithOrigin, 6);

TWO_WORD_HEAD(CMPIIndicationMIFT, ftVersion, 0);
TWO_WORD_HEAD(CMPIIndicationMIFT, miVersion, 1);
TWO_WORD_HEAD(CMPIIndicationMIFT, miName, 2);
TWO_WORD_HEAD(CMPIIndicationMIFT, cleanup, 3);
TWO_WORD_HEAD(CMPIIndicationMIFT, authorizeFilter, 4);
TWO_WORD_HEAD(CMPIIndicationMIFT, mustPoll, 5);
TWO_WORD_HEAD(CMPIIndicationMIFT, activateFilter, 6);
TWO_WORD_HEAD(CMPIIndicationMIFT, deActivateFilter, 7);
TWO_WORD_HEAD(CMPIIndicationMIFT, enableIndications, 8);
TWO_WORD_HEAD(CMPIIndicationMIFT, disableIndications, 9);

static_assert(sizeof(CMPIBrokerEncFT) == 21 * word);
static_assert(sizeof(CMPIBrokerFT) == 20 * word);
static_assert(sizeof(CMPIBrokerExtFT) == 21 * word);
static_assert(sizeof(CMPIBrokerMemFT) == 15 * word);
static_assert(sizeof(CMPIContextFT) == 7 * word);
static_assert(sizeof(CMPIResultFT) == 8 * word);
static_assert(sizeof(CMPIErrorFT) == 27 * word);
static_assert(sizeof(CMPIInstanceFT) == 11 * word);
static_assert(sizeof(CMPIObjectPathFT) == 20 * word);
static_assert(sizeof(CMPISelectExpFT) == 8 * word);
static_assert(sizeof(CMPISelectCondFT) == 5 * word);
static_assert(sizeof(CMPISubCondFT) == 6 * word);
static_assert(sizeof(CMPIPredicateFT) == 5 * word);
static_assert(sizeof(CMPIArgsFT) == 7 * word);
static_assert(sizeof(CMPIStringFT) == 4 * word);
static_assert(sizeof(CMPIArrayFT) == 7 * word);
static_assert(sizeof(CMPIEnumerationFT) == 6 * word);
static_assert(sizeof(CMPIDateTimeFT) == 6 * word);
static_assert(sizeof(CMPIInstanceMIFT) == 10 * word);
static_assert(sizeof(CMPIAssociationMIFT) == 7 * word);
static_assert(sizeof(CMPIMethodMIFT) == 4 * word);
static_assert(sizeof(CMPIPropertyMIFT) == 6 * word);
static_assert(sizeof(CMPIIndicationMIFT) == 9 * word);

static_assert(sizeof(CMPIValue) == 16 && sizeof(CMPIData) == 24 && sizeof(CMPIStatus) == 16 && sizeof(CMPIrc) == 4);
static_assert(offsetof(CMPIData, state) == 2 && offsetof(CMPIData, value) == 8 && offsetof(CMPIStatus, msg) == 8);
static_assert(offsetof(CMPIValuePtr, length) == word);
static_assert(offsetof(CMPIBroker, bft) == word && offsetof(CMPIBroker, eft) == 2 * word &&
              offsetof(CMPIBroker, xft) == 3 * word && offsetof(CMPIBroker, mft) == 4 * word);
static_assert(offsetof(CMPIInstance, ft) == word && offsetof(CMPIInstanceMI, ft) == word);
static_assert(sizeof(CMPIBoolean) == 1 && sizeof(CMPIChar16) == 2 && sizeof(CMPICount) == 4 && sizeof(CMPIType) == 2);
static_assert(CMPI_uint64 == 176 && CMPI_sint64 == 240 && CMPI_string == 0x1600 && CMPI_dateTime == 0x1800);
static_assert(CMPI_refA == 0x3100 && CMPI_INTEGER == 192 && CMPI_RC_NEVER_UNLOAD == 51 && CMPI_RC_ERROR == 200);

TEST(CmpiDeclarations, AConvenienceCallReachesTheSlotOfItsName)
{
    static CMPIUint32 seen;
    CMPIInstanceFT table{};
    table.setProperty = [](const CMPIInstance*, const char*, const CMPIValue* value, CMPIType type) {
        seen = value->uint32 + type;
        return CMPIStatus{CMPI_RC_ERR_NO_SUCH_PROPERTY, nullptr};
    };
    CMPIInstance instance{nullptr, &table};
    CMPIUint32 number = 5;
    CMPIStatus status = CMSetProperty(&instance, "Any", &number, CMPI_uint32);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
    EXPECT_EQ(seen, 5u + CMPI_uint32);
}
