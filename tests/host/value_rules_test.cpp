// What brokers do with a provider's values, row by row.
#include "tests/host/Things.h"

using namespace host;

namespace {

class Value_Rules : public things::In_Every_Manner {
protected:
    std::unique_ptr<Host> server = things::make_host(manner());
    bool tolerant() const { return is("sfcb") || is("sfcb-1.3.7"); }

    /// Runs a probe on an empty TEST_Thing.
    void probe(const std::function<void(const CMPIBroker*, CMPIInstance*)>& body)
    {
        server->on_request_thread([&](const CMPIBroker* mb, const CMPIContext*) {
            CMPIObjectPath* path = mb->eft->newObjectPath(mb, things::space, "TEST_Thing", nullptr);
            CMPIInstance* instance = mb->eft->newInstance(mb, path, nullptr);
            body(mb, instance);
            instance->ft->release(instance);
            path->ft->release(path);
        });
    }
    static CMPIStatus set_text(CMPIInstance* instance, const char* name, const char* text)
    {
        return instance->ft->setProperty(instance, name, reinterpret_cast<const CMPIValue*>(text), CMPI_chars);
    }
};
FOR_EVERY_MANNER(Value_Rules);

TEST_P(Value_Rules, AUint16OnAUint32Property)
{
    probe([&](const CMPIBroker*, CMPIInstance* instance) {
        CMPIValue value{};
        value.uint16 = 7;
        EXPECT_EQ(tolerant() ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_DATA_TYPE,
                  instance->ft->setProperty(instance, "U32", &value, CMPI_uint16).rc);
        CMPIStatus status{};
        CMPIData data = instance->ft->getProperty(instance, "U32", &status);
        EXPECT_EQ(CMPI_RC_OK, status.rc);
        EXPECT_EQ(tolerant() ? 0 : CMPI_nullValue, data.state);
        if (tolerant()) {
            EXPECT_EQ(7u, data.value.uint32);
        }
    });
    EXPECT_THAT(server->report().violations, testing::ElementsAre(testing::HasSubstr("TEST_Thing.U32 is uint32")));
}

TEST_P(Value_Rules, AnUnknownProperty)
{
    probe([&](const CMPIBroker*, CMPIInstance* instance) {
        CMPICount before = instance->ft->getPropertyCount(instance, nullptr);
        EXPECT_EQ(CMPI_RC_OK, set_text(instance, "Nonsense", "x").rc);
        EXPECT_EQ(before + (tolerant() ? 1 : 0), instance->ft->getPropertyCount(instance, nullptr));
        CMPIStatus status{};
        instance->ft->getProperty(instance, "Nonsense", &status);
        EXPECT_EQ(tolerant() ? CMPI_RC_OK : CMPI_RC_ERR_NO_SUCH_PROPERTY, status.rc);
        if (!tolerant()) return;
        CMPIString* name = nullptr;
        instance->ft->getPropertyAt(instance, before, &name, nullptr);
        EXPECT_STREQ("Nonsense", name->ft->getCharPtr(name, nullptr));
    });
    EXPECT_EQ(1u, server->report().violation_count);
}

TEST_P(Value_Rules, APropertyThatTheFilterLeftOut)
{
    probe([&](const CMPIBroker*, CMPIInstance* instance) {
        const char* names[] = {"State", nullptr};
        const char* keys[] = {"Id", "Realm", nullptr};
        EXPECT_EQ(CMPI_RC_OK, instance->ft->setPropertyFilter(instance, names, keys).rc);
        EXPECT_EQ(CMPI_RC_OK, set_text(instance, "Text", "x").rc);
        EXPECT_EQ(CMPI_RC_OK, set_text(instance, "Realm", "r").rc);
        CMPIData text = instance->ft->getProperty(instance, "Text", nullptr);
        EXPECT_EQ(is("pegasus") ? 0 : CMPI_nullValue, text.state);
        EXPECT_EQ(0, instance->ft->getProperty(instance, "Realm", nullptr).state) << "keys pass";
    });
    // Whatever the object keeps, a client gets what it asked for.
    things::set("count", 1);
    Answer answer = server->enumerate(things::space, "TEST_Thing", {{"State"}});
    ASSERT_EQ(1u, answer.instances.size()) << answer.status.message;
    std::vector<std::string> names;
    for (const Named_Value& property : answer.instances[0].properties)
        names.push_back(property.name);
    EXPECT_THAT(names, testing::ElementsAre("Id", "Realm", "State"));
}

TEST_P(Value_Rules, AStringArraysElementGivenAsChars)
{
    probe([&](const CMPIBroker* mb, CMPIInstance*) {
        CMPIArray* array = mb->eft->newArray(mb, 1, CMPI_string, nullptr);
        EXPECT_EQ(tolerant() ? CMPI_RC_OK : CMPI_RC_ERR_TYPE_MISMATCH,
                  array->ft->setElementAt(array, 0, reinterpret_cast<const CMPIValue*>("x"), CMPI_chars).rc);
        EXPECT_EQ(tolerant() ? 0 : CMPI_nullValue, array->ft->getElementAt(array, 0, nullptr).state);
        array->ft->release(array);
    });
}

TEST_P(Value_Rules, AStringOfNull)
{
    probe([&](const CMPIBroker* mb, CMPIInstance*) {
        CMPIStatus status{};
        CMPIString* string = mb->eft->newString(mb, nullptr, &status);
        EXPECT_EQ(tolerant(), string != nullptr);
        EXPECT_EQ(tolerant() ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_PARAMETER, status.rc);
        if (string) string->ft->release(string);
    });
}

TEST_P(Value_Rules, ObjectsOfAnUnknownClass)
{
    probe([&](const CMPIBroker* mb, CMPIInstance*) {
        CMPIStatus status{};
        CMPIObjectPath* path = mb->eft->newObjectPath(mb, things::space, "No_Such", &status);
        ASSERT_NE(nullptr, path);
        EXPECT_EQ(CMPI_RC_OK, status.rc);
        CMPIInstance* instance = mb->eft->newInstance(mb, path, &status);
        ASSERT_NE(nullptr, instance);
        EXPECT_EQ(CMPI_RC_OK, status.rc);
        instance->ft->release(instance);
        path->ft->release(path);
    });
    EXPECT_EQ("", server->report().to_text());
}

TEST_P(Value_Rules, UnknownNamesOfPropertiesAndKeys)
{
    const int state = tolerant() ? 0x400 : 0x500;
    probe([&](const CMPIBroker*, CMPIInstance* instance) {
        CMPIStatus status{};
        EXPECT_EQ(state, instance->ft->getProperty(instance, "Nix", &status).state);
        EXPECT_EQ(CMPI_RC_ERR_NO_SUCH_PROPERTY, status.rc);
        CMPIObjectPath* path = instance->ft->getObjectPath(instance, nullptr);
        EXPECT_EQ(state, path->ft->getKey(path, "Nix", &status).state);
        EXPECT_EQ(CMPI_RC_ERR_NOT_FOUND, status.rc);
    });
}

TEST_P(Value_Rules, TheStateOfAKey)
{
    probe([&](const CMPIBroker*, CMPIInstance* instance) {
        CMPIObjectPath* path = instance->ft->getObjectPath(instance, nullptr);
        CMPIValue value{};
        value.uint32 = 1;
        path->ft->addKey(path, "Id", &value, CMPI_uint32);
        EXPECT_EQ(tolerant() ? 0 : CMPI_keyValue, path->ft->getKey(path, "id", nullptr).state);
    });
}

TEST_P(Value_Rules, AssociationClassAndHostName)
{
    things::set("count", 1);
    EXPECT_TRUE(server->associators(things::thing(1)).ok());
    EXPECT_TRUE(server->references(things::thing(1)).ok());
    const std::string seen = is("pegasus") ? "TEST_Link" : "null";
    EXPECT_THAT(things::events(),
                testing::IsSupersetOf({"associators " + seen + " null", "references " + seen + " null"}));
    EXPECT_EQ(is("pegasus"), manner().host_name_in_paths);
}

TEST_P(Value_Rules, EntriesOfARequestsContext)
{
    server->on_request_thread([&](const CMPIBroker*, const CMPIContext* ctx) {
        CMPIStatus status{};
        EXPECT_EQ(CMPI_uint32, ctx->ft->getEntry(ctx, CMPIInvocationFlags, &status).type);
        CMPIData principal = ctx->ft->getEntry(ctx, CMPIPrincipal, &status);
        ASSERT_EQ(CMPI_RC_OK, status.rc);
        const char* text = principal.value.string->ft->getCharPtr(principal.value.string, nullptr);
        if (is("pegasus"))
            EXPECT_STREQ("", text);
        else
            EXPECT_EQ(nullptr, text);
        for (const char* name : {CMPIInitNameSpace, CMPIRole, CMPIAcceptLanguage}) {
            ctx->ft->getEntry(ctx, name, &status);
            EXPECT_EQ(is("pegasus") ? CMPI_RC_OK : CMPI_RC_ERR_NOT_FOUND, status.rc) << name;
        }
        ctx->ft->getEntry(ctx, "CMPISessionId", &status);
        EXPECT_EQ(tolerant() ? CMPI_RC_OK : CMPI_RC_ERR_NOT_FOUND, status.rc);
    });
}

TEST_P(Value_Rules, APrincipalThatIsKnownIsATextEverywhere)
{
    Host_Options options = things::options(manner());
    options.principal = "admin";
    Host named(things::schema(), options);
    named.on_request_thread([&](const CMPIBroker*, const CMPIContext* ctx) {
        CMPIData principal = ctx->ft->getEntry(ctx, CMPIPrincipal, nullptr);
        EXPECT_STREQ("admin", principal.value.string->ft->getCharPtr(principal.value.string, nullptr));
    });
}

TEST_P(Value_Rules, DateTimesBothWays)
{
    probe([&](const CMPIBroker* mb, CMPIInstance*) {
        CMPIStatus status{};
        CMPIDateTime* time = mb->eft->newDateTimeFromChars(mb, "20240229120000.250000+060", &status);
        ASSERT_NE(nullptr, time);
        EXPECT_EQ(1709204400250000ull, time->ft->getBinaryFormat(time, nullptr));
        EXPECT_FALSE(time->ft->isInterval(time, nullptr));
        time->ft->release(time);
        time = mb->eft->newDateTimeFromBinary(mb, 90061000001ull, CMPI_true, &status);
        CMPIString* text = time->ft->getStringFormat(time, nullptr);
        EXPECT_STREQ("00000001010101.000001:000", text->ft->getCharPtr(text, nullptr));
        EXPECT_TRUE(time->ft->isInterval(time, nullptr));
        time->ft->release(time);
        EXPECT_EQ(nullptr, mb->eft->newDateTimeFromChars(mb, "yesterday", &status));
        EXPECT_EQ(CMPI_RC_ERR_INVALID_PARAMETER, status.rc);
        EXPECT_EQ(nullptr, mb->eft->newDateTimeFromChars(mb, nullptr, &status));
    });
}

TEST_P(Value_Rules, WrongHandlesAreAnsweredAndNotFollowed)
{
    probe([&](const CMPIBroker* mb, CMPIInstance* instance) {
        CMPIStatus status{};
        auto* as_path = reinterpret_cast<CMPIObjectPath*>(instance);
        EXPECT_EQ(nullptr, mb->eft->newInstance(mb, nullptr, &status));
        EXPECT_EQ(nullptr, mb->eft->newInstance(mb, as_path, &status));
        EXPECT_EQ(CMPI_RC_ERR_INVALID_PARAMETER, status.rc);
        EXPECT_EQ(CMPI_RC_ERR_INVALID_PARAMETER, instance->ft->setProperty(instance, nullptr, nullptr, CMPI_null).rc);
        CMPIValue value{};
        value.string = reinterpret_cast<CMPIString*>(instance);
        EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, instance->ft->setProperty(instance, "Text", &value, CMPI_string).rc);
        EXPECT_EQ(nullptr, mb->eft->newArray(mb, 0xFFFFFFFF, CMPI_uint8, &status));
        EXPECT_TRUE(mb->eft->isOfType(mb, instance, "CMPIInstance", &status));
        EXPECT_FALSE(mb->eft->isOfType(mb, instance, "CMPIString", &status));
    });
}

} // namespace
