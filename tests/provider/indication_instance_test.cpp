/** What an indication holds, and what becomes of one that cannot be built. */
#include "tests/provider/Indications.h"

#include <cmpimacs.h>
#include <unistd.h>

namespace {

using namespace provider_test;
using namespace Orv::NetworkAdapterComposite;
using marlo::Value;
using marlo::test::Failure;
using testing::AllOf;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::SizeIs;

const std::string CREATE = "createNetworkAdapterIndicationInstance";

/** A host name of the machine that the test runs on, as the provider asks for it. */
std::string hostName() {
    std::array<char, 1025> name{};
    gethostname(name.data(), name.size() - 1);
    return name.data();
}

class IndicationInstance : public Indications {
  protected:
    IndicationInstance() { saveContext(); }

    CMPIInstance* create(const std::string& word = "Online",
                         const std::string& className = "MARLO_NetworkAdapterOnlineEvent",
                         const std::string& description = "Adapter eth0", const std::string& name = "eth0") {
        return createNetworkAdapterIndicationInstance(className, description, Orv::DateTime(EVENT_TIME), word, name);
    }

    /** What create() makes, which must be something. */
    template <typename... Arguments>
    marlo::Instance created(const Arguments&... arguments) {
        const CMPIInstance* instance = create(arguments...);
        if (instance == nullptr) {
            throw std::logic_error("no instance");
        }
        return marlo::broker::Broker::toModel(*instance);
    }
};

TEST_F(IndicationInstance, HoldsEverythingInOrder) {
    const marlo::Instance instance = created();
    EXPECT_EQ(instance.path.nameSpace, "root/tavis");
    EXPECT_EQ(instance.path.className, "MARLO_NetworkAdapterOnlineEvent");
    EXPECT_EQ(instance.path.host, hostName());
    EXPECT_THAT(names(instance), ElementsAre("IndicationIdentifier", "EventID", "IndicationTime", "EventTime",
                                             "AlertingManagedElement", "CorrelatedIndications", "PerceivedSeverity",
                                             "Description", "Message", "MessageID", "AlertingElementFormat",
                                             "AlertType", "ProbableCause", "SystemCreationClassName", "SystemName",
                                             "UniqueSystemID", "OwningEntity", "ProviderName"));
    const auto text = [&](const char* property) { return get(instance, property); };
    EXPECT_EQ(text("IndicationIdentifier"), Value::string("NetworkPort:Adapter eth0Online"));
    EXPECT_EQ(text("EventID"), Value::string("NetworkPort:Adapter eth0Online"));
    EXPECT_EQ(text("CorrelatedIndications"), strings({}));
    EXPECT_EQ(text("PerceivedSeverity"), Value::uint(CMPI_uint16, 2));
    EXPECT_EQ(text("Description"), Value::string("Text of ONLINE"));
    EXPECT_EQ(text("Message"), Value::string("Text of ONLINE"));
    EXPECT_EQ(text("MessageID"), Value::string("10816"));
    EXPECT_EQ(text("AlertingElementFormat"), Value::uint(CMPI_uint16, 2));
    EXPECT_EQ(text("AlertType"), Value::uint(CMPI_uint16, 3));
    EXPECT_EQ(text("ProbableCause"), Value::uint(CMPI_uint16, 1));
    EXPECT_EQ(text("SystemCreationClassName"), Value::string("TAVIS_ComputerSystem"));
    EXPECT_EQ(text("SystemName"), Value::string(hostName()));
    EXPECT_EQ(text("UniqueSystemID"), Value::string("4c4c4544-0042"));
    EXPECT_EQ(text("OwningEntity"), Value::string("Ostrel"));
    EXPECT_EQ(text("ProviderName"), Value::string("NetworkAdapterProvider"));
}

/** The names and types that setProperty is called with. */
struct TypeSpy {
    static inline std::vector<std::pair<std::string, CMPIType>> seen;
    static inline CMPIInstanceFT real{};
    static inline CMPIInstanceFT table{};
    static inline CMPIInstance* (*newInstance)(const CMPIBroker*, const CMPIObjectPath*, CMPIStatus*) = nullptr;
    CMPIBrokerEncFT factories;

    explicit TypeSpy(CMPIBroker& broker) : factories(*broker.eft) {
        seen.clear();
        newInstance = factories.newInstance;
        factories.newInstance = [](const CMPIBroker* self, const CMPIObjectPath* path, CMPIStatus* status) {
            CMPIInstance* instance = newInstance(self, path, status);
            real = table = *instance->ft;
            table.setProperty = [](const CMPIInstance* target, const char* name, const CMPIValue* value,
                                   CMPIType type) {
                seen.emplace_back(name, type);
                return real.setProperty(target, name, value, type);
            };
            instance->ft = &table;
            return instance;
        };
        broker.eft = &factories;
    }
};

TEST_F(IndicationInstance, SetsEveryPropertyOnceWithItsType) {
    const TypeSpy spy(setup.faulty.changeable());
    create();
    using Property = std::pair<std::string, CMPIType>;
    EXPECT_THAT(TypeSpy::seen,
                ElementsAre(Property{"IndicationIdentifier", CMPI_chars}, Property{"EventID", CMPI_chars},
                            Property{"IndicationTime", CMPI_dateTime}, Property{"EventTime", CMPI_dateTime},
                            Property{"AlertingManagedElement", CMPI_chars},
                            Property{"CorrelatedIndications", CMPI_stringA},
                            Property{"PerceivedSeverity", CMPI_uint16}, Property{"Description", CMPI_chars},
                            Property{"Message", CMPI_chars}, Property{"MessageID", CMPI_chars},
                            Property{"AlertingElementFormat", CMPI_uint16}, Property{"AlertType", CMPI_uint16},
                            Property{"ProbableCause", CMPI_uint16}, Property{"SystemCreationClassName", CMPI_chars},
                            Property{"SystemName", CMPI_chars}, Property{"UniqueSystemID", CMPI_chars},
                            Property{"OwningEntity", CMPI_chars}, Property{"ProviderName", CMPI_chars}));
}

TEST_F(IndicationInstance, MakesItsCallsInOneOrder) {
    noteBrokerCalls();
    create();
    const std::string host = hostName();
    const auto set = [](const std::string& property) { return "broker: instance.setProperty " + property; };
    EXPECT_THAT(steps(), testing::ElementsAreArray({
                             entering(CREATE),
                             std::string("broker: newObjectPath root/tavis MARLO_NetworkAdapterOnlineEvent"),
                             message(CREATE, "Before systemname"),
                             std::string("broker: objectPath.setNameSpace root/tavis"),
                             "broker: objectPath.setHostname " + host,
                             message(CREATE, "Before Created instance"),
                             std::string("broker: newInstance"),
                             set("IndicationIdentifier"),
                             set("EventID"),
                             entering("convertCIMDateTime"),
                             variable(CREATE, "datTime", "20090307050409.000250+060"),
                             std::string("broker: newDateTimeFromChars 20090307050409.000250+060"),
                             set("IndicationTime"),
                             set("EventTime"),
                             std::string("broker: newObjectPath root/tavis MARLO_PhysicalNetworkAdapter"),
                             std::string("broker: objectPath.getNameSpace"),
                             std::string("broker: string.getCharPtr"),
                             std::string("broker: objectPath.setNameSpace root/tavis"),
                             "broker: objectPath.setHostname " + host,
                             std::string("broker: objectPath.addKey CreationClassName"),
                             std::string("broker: objectPath.addKey Tag"),
                             message(CREATE, "Before AME"),
                             std::string("broker: objectPath.toString"),
                             std::string("broker: string.getCharPtr"),
                             set("AlertingManagedElement"),
                             std::string("broker: newArray 0"),
                             set("CorrelatedIndications"),
                             std::string("Locale::getLanguageId() = 7"),
                             std::string("Locale::getResourceLibrary(1, 7)"),
                             std::string("ResourceString(\"MSGID_NAI_NIC_ONLINE\") = \"Text of ONLINE\""),
                             set("PerceivedSeverity"),
                             std::string("make_string(\"Text of ONLINE\")"),
                             set("Description"),
                             std::string("make_string(\"Text of ONLINE\")"),
                             set("Message"),
                             set("MessageID"),
                             set("AlertingElementFormat"),
                             set("AlertType"),
                             set("ProbableCause"),
                             set("SystemCreationClassName"),
                             set("SystemName"),
                             std::string("Product::getUid() = \"4c4c4544-0042\""),
                             std::string("make_string(\"4c4c4544-0042\")"),
                             set("UniqueSystemID"),
                             set("OwningEntity"),
                             set("ProviderName"),
                         }))
        << "there is no exit";
}

TEST_F(IndicationInstance, BothTimesAreTheEvents) {
    const marlo::Instance instance = created();
    EXPECT_EQ(get(instance, "IndicationTime").type, CMPI_dateTime);
    EXPECT_EQ(get(instance, "IndicationTime"), get(instance, "EventTime"));
    CMPIDateTime* expected = CMNewDateTimeFromChars(setup.real.handle(), "20090307050409.000250+060", nullptr);
    CMPIData data{};
    data.type = CMPI_dateTime;
    data.value.dateTime = expected;
    EXPECT_EQ(get(instance, "EventTime"), marlo::broker::Broker::toModel(data));
}

TEST_F(IndicationInstance, AlertingElementIsThePathOfThePhysicalAdapter) {
    const std::string path = std::get<std::string>(
        get(created("Online", "MARLO_NetworkAdapterOnlineEvent", "any", "e\"th 0"), "AlertingManagedElement").data);
    EXPECT_THAT(path, AllOf(HasSubstr(hostName()), HasSubstr("root/tavis:MARLO_PhysicalNetworkAdapter."),
                            HasSubstr("CreationClassName=\"MARLO_PhysicalNetworkAdapter\""),
                            HasSubstr("Tag=\"e\\\"th 0\"")));
}

struct Word {
    const char* word;
    std::uint64_t severity;
    const char* text;
    const char* number;
};

class EventWords : public IndicationInstance, public testing::WithParamInterface<Word> {};

TEST_P(EventWords, DecideSeverityMessageAndNumber) {
    const marlo::Instance instance = created(GetParam().word, "MARLO_NetworkAdapterOfflineEvent");
    EXPECT_EQ(get(instance, "PerceivedSeverity"), Value::uint(CMPI_uint16, GetParam().severity));
    EXPECT_EQ(get(instance, "Description"), Value::string(GetParam().text));
    EXPECT_EQ(get(instance, "Message"), Value::string(GetParam().text));
    EXPECT_EQ(get(instance, "MessageID"), Value::string(GetParam().number));
    EXPECT_EQ(get(instance, "EventID"), Value::string(std::string("NetworkPort:Adapter eth0") + GetParam().word));
    EXPECT_EQ(instance.path.className, "MARLO_NetworkAdapterOfflineEvent");
    EXPECT_THAT(instance.properties, SizeIs(18));
}

INSTANTIATE_TEST_SUITE_P(All, EventWords,
                         testing::Values(Word{"Offline", 3, "Text of OFFLINE", "10817"},
                                         Word{"Online", 2, "Text of ONLINE", "10816"},
                                         Word{"SwitchOver", 3, "Text of SWITCHOVER", "10820"},
                                         Word{"SwitchBack", 2, "Text of SWITCHBACK", "10819"},
                                         Word{"Failed", 6, "Text of FAILED", "10818"}, Word{"", 0, "", ""},
                                         Word{"online", 0, "", ""}, Word{"Switchback", 0, "", ""},
                                         Word{"Online ", 0, "", ""}),
                         [](const auto& instance) { return "Word" + std::to_string(instance.index); });

TEST_F(IndicationInstance, EventWordWithoutMessageAsksForNone) {
    create("Nothing");
    EXPECT_THAT(scripted_agent::recorded("Locale"), IsEmpty());
    EXPECT_THAT(scripted_agent::recorded("ResourceString"), IsEmpty());
}

TEST_F(IndicationInstance, EmptyDescriptionAndWordLeaveThePrefix) {
    const marlo::Instance instance = created("", "MARLO_NetworkAdapterOnlineEvent", "", "");
    EXPECT_EQ(get(instance, "IndicationIdentifier"), Value::string("NetworkPort:"));
    EXPECT_EQ(get(instance, "EventID"), Value::string("NetworkPort:"));
}

TEST_F(IndicationInstance, LongDescriptionAndNameAreNotCut) {
    const std::string longText(100'000, 'd');
    const marlo::Instance instance = created("Online", "MARLO_NetworkAdapterOnlineEvent", longText, longText);
    EXPECT_EQ(get(instance, "EventID"), Value::string("NetworkPort:" + longText + "Online"));
    EXPECT_THAT(std::get<std::string>(get(instance, "AlertingManagedElement").data), HasSubstr(longText));
}

TEST_F(IndicationInstance, MessageThatIsTooLongIsCutAndNeverOverruns) {
    // AddressSanitizer would tell of a character past the end.
    for (const std::size_t length : {510U, 511U, 512U, 513U, 5000U}) {
        scripted_agent::script().messages[L"MSGID_NAI_NIC_ONLINE"] = std::wstring(length, L'm');
        const std::string expected(std::min<std::size_t>(length, 511), 'm');
        EXPECT_EQ(get(created(), "Message"), Value::string(expected)) << length;
    }
}

TEST_F(IndicationInstance, MessageThatTheAgentDoesNotHaveIsEmpty) {
    scripted_agent::script().messages.clear();
    const marlo::Instance instance = created();
    EXPECT_EQ(get(instance, "Message"), Value::string(""));
    EXPECT_EQ(get(instance, "Description"), Value::string(""));
    EXPECT_EQ(get(instance, "MessageID"), Value::string("10816"));
}

TEST_F(IndicationInstance, LanguageWithoutTextsGivesEmptyMessages) {
    scripted_agent::script().languageId = 8;
    EXPECT_EQ(get(created(), "Message"), Value::string(""));
    EXPECT_THAT(scripted_agent::record(), Contains("Locale::getResourceLibrary(1, 8)"));
}

TEST_F(IndicationInstance, MessagesOfAnyScriptAreKept) {
    scripted_agent::script().messages[L"MSGID_NAI_NIC_ONLINE"] = L"Verbindung \u00fcber Adapter";
    create();
    EXPECT_THAT(scripted_agent::recorded("make_string(\"Verbindung ?ber Adapter"), SizeIs(2));
}

TEST_F(IndicationInstance, TimeThatTheBrokerCannotReadIsNull) {
    // One hour west of UTC makes a text of 24 characters.
    Orv::DateTime::Fields west = EVENT_TIME;
    west.offset = -1;
    const CMPIInstance* made = createNetworkAdapterIndicationInstance("MARLO_NetworkAdapterOnlineEvent", "any",
                                                                      Orv::DateTime(west), "Online", "eth0");
    ASSERT_NE(made, nullptr);
    const marlo::Instance instance = marlo::broker::Broker::toModel(*made);
    EXPECT_TRUE(get(instance, "IndicationTime").isNull());
    EXPECT_TRUE(get(instance, "EventTime").isNull());
    EXPECT_THAT(instance.properties, SizeIs(18));
}

TEST_F(IndicationInstance, WithoutAPathOfItsOwnThereIsNone) {
    for (const Failure failure : {Failure::withStatus, Failure::silently}) {
        scripted_agent::clearRecord();
        setup.faulty.failAt("newObjectPath", 1, failure);
        EXPECT_EQ(create(), nullptr);
        EXPECT_THAT(setup.faulty.calls(), ElementsAre("newObjectPath root/tavis MARLO_NetworkAdapterOnlineEvent"));
        EXPECT_THAT(log(), ElementsAre(entering(CREATE), message(CREATE, "Failed to create ObjectPath", 6000)));
    }
}

TEST_F(IndicationInstance, WithoutThePathOfTheAlertingElementThereIsNone) {
    setup.faulty.failAt("newObjectPath", 2, Failure::withStatus);
    EXPECT_EQ(create(), nullptr);
    EXPECT_EQ(setup.faulty.calls().back(), "newObjectPath root/tavis MARLO_PhysicalNetworkAdapter");
    EXPECT_EQ(log().back(), message(CREATE, "Failed to create ObjectPath for Alerting Managed Element", 6000));
}

TEST_F(IndicationInstance, InstanceThatIsNotMadeIsReturnedAsItIs) {
    setup.faulty.failAt("newInstance", 1, Failure::withStatus);
    EXPECT_EQ(create(), nullptr);
    EXPECT_EQ(setup.faulty.calls().back(), "newInstance");
    EXPECT_EQ(log().back(), message(CREATE, "instance is NULL", 6000));
}

/** What the broker's factories give is without a handle. */
struct HandleLoser {
    static inline CMPIInstance instance{};
    static inline CMPIObjectPath path{};
    static inline int pathsToMake = 0;
    static inline CMPIObjectPath* (*newObjectPath)(const CMPIBroker*, const char*, const char*,
                                                   CMPIStatus*) = nullptr;
    CMPIBrokerEncFT factories;

    explicit HandleLoser(CMPIBroker& broker) : factories(*broker.eft) {
        newObjectPath = factories.newObjectPath;
        broker.eft = &factories;
    }

    void losePathsAfter(int count) {
        pathsToMake = count;
        factories.newObjectPath = [](const CMPIBroker* self, const char* nameSpace, const char* className,
                                     CMPIStatus* status) {
            return pathsToMake-- > 0 ? newObjectPath(self, nameSpace, className, status) : &path;
        };
    }

    void loseInstance() {
        factories.newInstance = [](const CMPIBroker*, const CMPIObjectPath*, CMPIStatus*) { return &instance; };
    }
};

TEST_F(IndicationInstance, PathsWithoutHandleCountAsNone) {
    HandleLoser loser(setup.faulty.changeable());
    loser.losePathsAfter(0);
    EXPECT_EQ(create(), nullptr);
    EXPECT_EQ(log().back(), message(CREATE, "Failed to create ObjectPath", 6000));
    loser.losePathsAfter(1);
    EXPECT_EQ(create(), nullptr);
    EXPECT_EQ(log().back(), message(CREATE, "Failed to create ObjectPath for Alerting Managed Element", 6000));
}

TEST_F(IndicationInstance, InstanceWithoutHandleIsReturnedAsItIs) {
    HandleLoser loser(setup.faulty.changeable());
    loser.loseInstance();
    EXPECT_EQ(create(), &HandleLoser::instance);
    EXPECT_EQ(log().back(), message(CREATE, "instance is NULL", 6000));
}

TEST_F(IndicationInstance, EveryOtherCallMayFailWithoutLosingTheIndication) {
    create();
    auto counts = setup.faulty.counts();
    for (const char* fatal : {"newObjectPath", "newInstance"}) {
        counts.erase(fatal);
    }
    ASSERT_THAT(counts, SizeIs(9));
    for (const auto& [slot, count] : counts) {
        for (int nth = 1; nth <= count; ++nth) {
            for (const Failure failure : {Failure::withStatus, Failure::silently}) {
                SCOPED_TRACE(slot + " " + std::to_string(nth));
                setup.faulty.failAt(slot, nth, failure);
                const std::size_t lost = slot == "instance.setProperty" ? 1 : 0;
                EXPECT_THAT(created().properties, SizeIs(18 - lost));
            }
        }
    }
}

TEST_F(IndicationInstance, WhatTheBrokerThrowsEndsItWithoutAnInstance) {
    create();
    for (const auto& [slot, count] : setup.faulty.counts()) {
        SCOPED_TRACE(slot);
        setup.faulty.failAt(slot, 1, Failure::throwing);
        EXPECT_EQ(create(), nullptr);
        EXPECT_EQ(log().back(), message(CREATE, "Caught Exception", 6000));
    }
}

TEST_F(IndicationInstance, WhatTheAgentThrowsEndsItWithoutAnInstance) {
    for (const char* call : {"Locale::getLanguageId", "Locale::getResourceLibrary", "ResourceString", "make_string",
                             "Product::getUid"}) {
        SCOPED_TRACE(call);
        scripted_agent::failAt(call, 1, [] { throw std::runtime_error("the agent is gone"); });
        EXPECT_EQ(create(), nullptr);
        EXPECT_EQ(log().back(), message(CREATE, "Caught Exception", 6000));
    }
}

} // namespace
