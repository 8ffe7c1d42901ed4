// The broker's tables, slot by slot, as each manner has them.
#include "tests/host/Things.h"

#include <cerrno>
#include <ctime>

using namespace host;

namespace {

class Tables : public things::In_Every_Manner {
protected:
    std::unique_ptr<Host> server = things::make_host(manner());
    bool old() const { return !is("pegasus"); } ///< version 1 tables
};
FOR_EVERY_MANNER(Tables);

TEST_P(Tables, BrokerTableTellsVersionNameAndCapabilities)
{
    const CMPIBrokerFT& ft = *server->broker()->bft;
    const char* name = is("strict") ? "Norvane strict broker" : is("pegasus") ? "Pegasus" : "RequestHandler";
    EXPECT_STREQ(name, ft.brokerName);
    EXPECT_EQ(is("pegasus") ? 200u : 0u, ft.brokerVersion);
    EXPECT_EQ(is("pegasus") ? 0x81ffu : 0x1bfu, ft.brokerCapabilities);
    EXPECT_TRUE(ft.prepareAttachThread && ft.attachThread && ft.detachThread && ft.deliverIndication);
    EXPECT_TRUE(ft.enumerateInstanceNames && ft.getInstance && ft.createInstance && ft.modifyInstance &&
                ft.deleteInstance);
    EXPECT_TRUE(ft.execQuery && ft.enumerateInstances && ft.associators && ft.associatorNames && ft.references);
    EXPECT_TRUE(ft.referenceNames && ft.invokeMethod && ft.setProperty && ft.getProperty);
}

TEST_P(Tables, EncapsulationTableHasItsVersionAndHoles)
{
    const CMPIBrokerEncFT& ft = *server->broker()->eft;
    EXPECT_EQ(old() ? 1 : 200, ft.ftVersion);
    EXPECT_EQ(old(), ft.newCMPIError == nullptr);
    EXPECT_EQ(old(), ft.openMessageFile == nullptr);
    EXPECT_EQ(old(), ft.closeMessageFile == nullptr);
    EXPECT_EQ(old(), ft.getMessage2 == nullptr);
    EXPECT_TRUE(ft.newInstance && ft.newObjectPath && ft.newArgs && ft.newString && ft.newArray && ft.newDateTime);
    EXPECT_TRUE(ft.newDateTimeFromBinary && ft.newDateTimeFromChars && ft.newSelectExp && ft.classPathIsA);
    EXPECT_TRUE(ft.toString && ft.isOfType && ft.getType && ft.getMessage && ft.logMessage && ft.trace);
}

TEST_P(Tables, ThreadTableHasItsHoles)
{
    const CMPIBrokerExtFT& ft = *server->broker()->xft;
    EXPECT_EQ(200, ft.ftVersion);
    EXPECT_EQ(old(), ft.joinThread == nullptr);
    EXPECT_EQ(old(), ft.exitThread == nullptr);
    EXPECT_EQ(old(), ft.cancelThread == nullptr);
    EXPECT_EQ(old(), ft.threadSleep == nullptr);
    EXPECT_EQ(old(), ft.signalCondition == nullptr);
    EXPECT_TRUE(ft.newThread && ft.threadOnce && ft.createThreadKey && ft.destroyThreadKey && ft.getThreadSpecific);
    EXPECT_TRUE(ft.setThreadSpecific && ft.newMutex && ft.condWait && ft.timedCondWait && ft.resolveFileName);
}

TEST_P(Tables, MemoryTableIsThereInOneServerOnly)
{
    const CMPIBrokerMemFT* ft = server->broker()->mft;
    ASSERT_EQ(is("sfcb"), ft != nullptr);
    if (!ft) return;
    EXPECT_TRUE(ft->mark && ft->release);
    EXPECT_TRUE(!ft->cmpiMalloc && !ft->cmpiFree && !ft->freeInstance && !ft->freeSelectExp);
}

TEST_P(Tables, ObjectTablesHaveTheirVersionsAndHoles)
{
    server->on_request_thread([&](const CMPIBroker* mb, const CMPIContext* ctx) {
        CMPIObjectPath* path = mb->eft->newObjectPath(mb, things::space, "TEST_Thing", nullptr);
        CMPIInstance* instance = mb->eft->newInstance(mb, path, nullptr);
        const int version = old() ? 1 : 200;
        EXPECT_EQ(version, path->ft->ftVersion);
        EXPECT_EQ(version, instance->ft->ftVersion);
        EXPECT_EQ(version, ctx->ft->ftVersion);
        EXPECT_EQ(old(), instance->ft->setPropertyWithOrigin == nullptr);
        EXPECT_EQ(!is("sfcb"), path->ft->getPropertyQualifier == nullptr);
        EXPECT_TRUE(!path->ft->getClassQualifier && !path->ft->getMethodQualifier && !path->ft->getParameterQualifier);
        EXPECT_EQ(is("strict") || is("pegasus"), ctx->ft->clone == nullptr);
        instance->ft->release(instance);
        path->ft->release(path);
    });
    EXPECT_EQ("", server->report().to_text());
}

TEST_P(Tables, PropertyQualifiersAreReadWhereTheSlotIs)
{
    server->on_request_thread([&](const CMPIBroker* mb, const CMPIContext*) {
        CMPIObjectPath* path = mb->eft->newObjectPath(mb, things::space, "TEST_Thing", nullptr);
        if (!is("sfcb")) {
            EXPECT_EQ(nullptr, path->ft->getPropertyQualifier);
            path->ft->release(path);
            return;
        }
        CMPIStatus status{};
        CMPIData key = path->ft->getPropertyQualifier(path, "Id", "Key", &status);
        EXPECT_EQ(CMPI_RC_OK, status.rc);
        EXPECT_TRUE(key.type == CMPI_boolean && key.value.boolean);
        CMPIData words = path->ft->getPropertyQualifier(path, "State", "Values", &status);
        EXPECT_EQ(CMPI_stringA, words.type);
        path->ft->getPropertyQualifier(path, "State", "Nix", &status);
        EXPECT_EQ(CMPI_RC_ERR_NOT_FOUND, status.rc);
        path->ft->release(path);
    });
}

TEST_P(Tables, ATimedWaitThatRanOutAnswersTheServersNumber)
{
    const CMPIBrokerExtFT& ft = *server->broker()->xft;
    void *mutex = ft.newMutex(0), *condition = ft.newCondition(0);
    ft.lockMutex(mutex);
    timespec past{};
    clock_gettime(CLOCK_REALTIME, &past);
    EXPECT_EQ(is("pegasus") ? 0 : ETIMEDOUT, ft.timedCondWait(condition, mutex, &past));
    ft.unlockMutex(mutex);
    ft.destroyCondition(condition);
    ft.destroyMutex(mutex);
}

TEST_P(Tables, AThreadKeyFillsFourOfEightBytes)
{
    const CMPIBrokerExtFT& ft = *server->broker()->xft;
    unsigned long key = 0xAAAAAAAAAAAAAAAAul;
    ASSERT_EQ(0, ft.createThreadKey(&key, nullptr));
    EXPECT_EQ(0xAAAAAAAAul, key >> 32);
    int value = 0;
    EXPECT_EQ(0, ft.setThreadSpecific(key & 0xFFFFFFFF, &value));
    EXPECT_EQ(&value, ft.getThreadSpecific(key & 0xFFFFFFFF));
    EXPECT_EQ(0, ft.destroyThreadKey(key & 0xFFFFFFFF));
}

TEST_P(Tables, MarkAndReleaseFreeWhatWasMadeBetween)
{
    if (!is("sfcb")) {
        EXPECT_EQ(nullptr, server->broker()->mft);
        return;
    }
    server->on_request_thread([&](const CMPIBroker* mb, const CMPIContext*) {
        CMPIString* before = mb->eft->newString(mb, "before", nullptr);
        CMPIGcStat* mark = mb->mft->mark(mb, nullptr);
        mb->eft->newString(mb, "after", nullptr);
        mb->eft->newString(mb, "after", nullptr);
        EXPECT_EQ(CMPI_RC_OK, mb->mft->release(mb, mark).rc);
        EXPECT_STREQ("before", before->ft->getCharPtr(before, nullptr));
        before->ft->release(before);
    });
    EXPECT_EQ(3u, server->report().of(Object_Kind::string).released);
    EXPECT_EQ(0u, server->report().left());
}

TEST_P(Tables, ErrorsAreWholeObjectsWhereTheyCanBeMade)
{
    if (!is("pegasus")) {
        EXPECT_EQ(nullptr, server->broker()->eft->newCMPIError);
        return;
    }
    server->on_request_thread([&](const CMPIBroker* mb, const CMPIContext*) {
        CMPIError* error = mb->eft->newCMPIError(mb, "me", "M1", "broken", CMPIErrorSeverity(3),
                                                 CMPIErrorProbableCause(4), CMPI_RC_ERR_NOT_FOUND, nullptr);
        CMPIString* text = error->ft->getMessage(error, nullptr);
        EXPECT_STREQ("broken", text->ft->getCharPtr(text, nullptr));
        EXPECT_EQ(CMPI_RC_ERR_NOT_FOUND, error->ft->getCIMStatusCode(error, nullptr));
        error->ft->setErrorSource(error, "here");
        CMPIError* copy = error->ft->clone(error, nullptr);
        text = copy->ft->getErrorSource(copy, nullptr);
        EXPECT_STREQ("here", text->ft->getCharPtr(text, nullptr));
        copy->ft->release(copy);
        error->ft->release(error);
    });
    EXPECT_EQ("", server->report().to_text());
}

} // namespace
