// What a module asks of the server, on request threads and on its own.
#include "tests/host/Things.h"

#include <atomic>
#include <thread>

using namespace host;
using testing::Contains;
using testing::HasSubstr;
using testing::IsSupersetOf;

namespace {

class Up_Calls : public things::In_Every_Manner {
protected:
    void SetUp() override
    {
        things::In_Every_Manner::SetUp();
        things::set("count", 3);
    }
    std::unique_ptr<Host> server = things::make_host(manner());
    Answer hello() { return server->call(things::thing(1), "Hello"); }
};
FOR_EVERY_MANNER(Up_Calls);

TEST_P(Up_Calls, ComeBackIntoTheSameModule)
{
    things::set("up_calls", 1);
    ASSERT_TRUE(hello().ok());
    EXPECT_THAT(things::events(), IsSupersetOf({"enumerate 0", "instances 6", "get 0"}));
    EXPECT_EQ("", server->report().to_text());
}

TEST_P(Up_Calls, FindTheServersOwnInstances)
{
    Instance own;
    own.path = things::thing(77, "TEST_Silent");
    own.properties = own.path.keys;
    server->add_instance(own);
    things::set("up_calls", 1);
    ASSERT_TRUE(hello().ok());
    EXPECT_THAT(things::events(), Contains("instances 7"));
}

TEST_P(Up_Calls, WorkOnAThreadThatIsAttached)
{
    things::set("thread", 1);
    ASSERT_TRUE(hello().ok());
    EXPECT_THAT(things::events(), IsSupersetOf({"enumerate 0", "instances 6", "get 0"}));
    EXPECT_EQ("", server->report().to_text());
    EXPECT_EQ(1u, server->report().of(Object_Kind::context).made);
}

TEST_P(Up_Calls, AnEnumerationHeldAtTheDetachIsNoted)
{
    things::set("thread", 1);
    things::set("keep_enumeration", 1);
    ASSERT_TRUE(hello().ok());
    EXPECT_THAT(server->report().violations,
                Contains(HasSubstr("enumeration of an up-call is still held at the detach")));
    EXPECT_EQ(1u, server->report().of(Object_Kind::enumeration).left);
}

TEST_P(Up_Calls, AThreadThatNeverDetachesIsCounted)
{
    things::set("thread", 1);
    things::set("never_detach", 1);
    ASSERT_TRUE(hello().ok());
    EXPECT_EQ(1u, server->report().contexts_not_detached);
}

TEST_P(Up_Calls, ObjectsOfAThreadThatNobodyKnowsAreNoted)
{
    things::set("stray_thread", 1);
    ASSERT_TRUE(hello().ok());
    EXPECT_THAT(server->report().violations,
                testing::ElementsAre("CMPIString made on a thread that has no request and is not attached"));
}

TEST_P(Up_Calls, WithoutAContextAreRefused)
{
    server->on_request_thread([&](const CMPIBroker* mb, const CMPIContext* ctx) {
        CMPIStatus status{};
        CMPIObjectPath* path = mb->eft->newObjectPath(mb, things::space, "TEST_Other", nullptr);
        EXPECT_EQ(nullptr, mb->bft->enumerateInstances(mb, nullptr, path, nullptr, &status));
        EXPECT_EQ(CMPI_RC_ERR_INVALID_PARAMETER, status.rc);
        EXPECT_EQ(nullptr, mb->bft->enumerateInstances(mb, ctx, nullptr, nullptr, &status));
        EXPECT_EQ(nullptr, mb->bft->prepareAttachThread(mb, nullptr));
        EXPECT_NE(CMPI_RC_OK, mb->bft->detachThread(mb, ctx).rc);
        path->ft->setNameSpace(path, "root/nowhere");
        EXPECT_EQ(nullptr, mb->bft->enumerateInstances(mb, ctx, path, nullptr, &status));
        EXPECT_EQ(CMPI_RC_ERR_INVALID_NAMESPACE, status.rc);
        ASSERT_NE(nullptr, status.msg);
        EXPECT_STREQ("the server has no namespace root/nowhere", status.msg->ft->getCharPtr(status.msg, nullptr));
        path->ft->release(path);
    });
    EXPECT_EQ(3u, server->report().violation_count);
}

TEST_P(Up_Calls, EveryOperationHasItsWay)
{
    server->on_request_thread([&](const CMPIBroker* mb, const CMPIContext* ctx) {
        CMPIStatus status{};
        CMPIObjectPath* path = mb->eft->newObjectPath(mb, things::space, "TEST_Thing", nullptr);
        CMPIValue id{};
        id.uint32 = 1;
        CMPIInstance* instance = mb->eft->newInstance(mb, path, nullptr);
        instance->ft->setProperty(instance, "Id", &id, CMPI_uint32);
        CMPIObjectPath* created = mb->bft->createInstance(mb, ctx, path, instance, &status);
        ASSERT_NE(nullptr, created);
        CMPIEnumeration* names = mb->bft->enumerateInstanceNames(mb, ctx, path, &status);
        ASSERT_NE(nullptr, names);
        EXPECT_EQ(CMPI_ref, names->ft->getNext(names, nullptr).type);
        CMPIArray* array = names->ft->toArray(names, nullptr);
        EXPECT_EQ(3u, array->ft->getSize(array, nullptr));
        names->ft->release(names);
        CMPIValue state{};
        state.uint16 = 4;
        EXPECT_EQ(CMPI_RC_OK, mb->bft->setProperty(mb, ctx, created, "State", &state, CMPI_uint16).rc);
        EXPECT_EQ(1u, mb->bft->getProperty(mb, ctx, created, "State", &status).value.uint16);
        instance->ft->setProperty(instance, "State", &state, CMPI_uint16);
        EXPECT_EQ(CMPI_RC_OK, mb->bft->modifyInstance(mb, ctx, created, instance, nullptr).rc);
        EXPECT_EQ(CMPI_RC_ERR_ACCESS_DENIED, mb->bft->deleteInstance(mb, ctx, created).rc);
        CMPIEnumeration* ends[] = {
            mb->bft->associators(mb, ctx, created, nullptr, nullptr, nullptr, nullptr, nullptr, &status),
            mb->bft->associatorNames(mb, ctx, created, nullptr, nullptr, nullptr, nullptr, &status),
            mb->bft->references(mb, ctx, created, nullptr, nullptr, nullptr, &status),
            mb->bft->referenceNames(mb, ctx, created, nullptr, nullptr, &status)};
        for (CMPIEnumeration* end : ends) {
            ASSERT_NE(nullptr, end);
            EXPECT_TRUE(end->ft->hasNext(end, nullptr));
            end->ft->release(end);
        }
        CMPIArgs *in = mb->eft->newArgs(mb, nullptr), *out = mb->eft->newArgs(mb, nullptr);
        CMPIValue number{};
        number.uint32 = 4;
        in->ft->addArg(in, "Number", &number, CMPI_uint32);
        CMPIData data = mb->bft->invokeMethod(mb, ctx, created, "Double", in, out, &status);
        EXPECT_EQ(CMPI_uint32, data.type);
        EXPECT_EQ(8u, out->ft->getArg(out, "Result", nullptr).value.uint32);
        in->ft->release(in);
        out->ft->release(out);
        created->ft->release(created);
        instance->ft->release(instance);
        path->ft->release(path);
    });
    EXPECT_EQ("", server->report().to_text());
}

} // namespace
