/** The shared library from outside: what it exports and needs, its factories, its function tables, its refusals. */
#include "tests/provider/ProviderLibrary.h"
#include "tests/support/scripted_agent/ScriptedAgent.h"

#include <array>
#include <cstdio>
#include <memory>
#include <sstream>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace provider_test;
using testing::IsEmpty;
using testing::UnorderedElementsAre;

std::string output(const std::string& command) {
    const std::unique_ptr<FILE, int (*)(FILE*)> pipe(popen(command.c_str(), "r"), pclose);
    std::string text;
    std::array<char, 4096> piece{};
    while (pipe && std::fgets(piece.data(), static_cast<int>(piece.size()), pipe.get()) != nullptr) {
        text += piece.data();
    }
    return text;
}

const std::string LIBRARY = MARLO_PROVIDER_LIBRARY;

TEST(ProviderLibrary, ExportsTheFiveFactoriesAndNothingElse) {
    std::istringstream lines(output("nm -D --defined-only '" + LIBRARY + "'"));
    std::vector<std::string> names;
    std::string address;
    std::string kind;
    std::string name;
    while (lines >> address >> kind >> name) {
        names.push_back(name);
    }
    EXPECT_THAT(names, UnorderedElementsAre("LogicalNetworkAdapterProvider_Create_InstanceMI",
                                            "PhysicalNetworkAdapterProvider_Create_InstanceMI",
                                            "NetworkAdapterProvider_Create_InstanceMI",
                                            "NetworkAdapterProvider_Create_MethodMI",
                                            "NetworkAdapterProvider_Create_IndicationMI"));
}

TEST(ProviderLibrary, NeedsTheAgentAndTheLanguagesLibrariesOnly) {
    std::istringstream lines(output("readelf -dW '" + LIBRARY + "'"));
    std::vector<std::string> needed;
    for (std::string line; std::getline(lines, line);) {
        if (line.find("(NEEDED)") != std::string::npos) {
            const auto open = line.find('[');
            needed.push_back(line.substr(open + 1, line.find(']') - open - 1));
        }
    }
    EXPECT_THAT(needed, testing::Contains("libOrvAgent.so"));
    for (const std::string& name : needed) {
        const bool sanitizers = MARLO_SANITIZED && (name.starts_with("libasan") || name.starts_with("libubsan") ||
                                                    name.starts_with("libtsan"));
        EXPECT_TRUE(sanitizers || name == "libOrvAgent.so" || name == "libstdc++.so.6" || name == "libgcc_s.so.1" ||
                    name == "libm.so.6" || name == "libc.so.6" || name == "ld-linux-x86-64.so.2")
            << name;
    }
}

TEST(ProviderLibrary, KeepsItsSymbolsToItself) {
    ASSERT_NE(library(), nullptr);
    EXPECT_EQ(dlsym(RTLD_DEFAULT, "NetworkAdapterProvider_Create_InstanceMI"), nullptr);
}

TEST(ProviderLibrary, StaysMappedWhenTheLastUserLetsGo) {
    void* handle = dlopen(LIBRARY.c_str(), RTLD_NOW | RTLD_LOCAL);
    ASSERT_NE(handle, nullptr) << dlerror();
    dlclose(handle);
    dlclose(library());
    void* still = dlopen(LIBRARY.c_str(), RTLD_NOW | RTLD_LOCAL | RTLD_NOLOAD);
    EXPECT_NE(still, nullptr);
    EXPECT_NE(createInstanceMI("NetworkAdapterProvider", nullptr), nullptr);
}

/** Just enough of an object manager for a GetInstance without keys, which asks its broker for one string. */
struct TinyBroker {
    CMPIBrokerEncFT eft{};
    CMPIBroker broker{};
    static inline std::vector<const CMPIBroker*> asked;
    static inline std::string askedFor;
    static inline CMPIString message{};

    TinyBroker() {
        eft.newString = [](const CMPIBroker* self, const char* text, CMPIStatus*) {
            asked.push_back(self);
            askedFor = text;
            return &message;
        };
        broker.eft = &eft;
    }
};

class Factories : public testing::Test {
  protected:
    Factories() {
        scripted_agent::reset();
        TinyBroker::asked.clear();
        pathTable.getKeyCount = [](const CMPIObjectPath*, CMPIStatus*) -> CMPICount { return 0; };
        resultTable.returnDone = [](const CMPIResult*) -> CMPIStatus { return {CMPI_RC_OK, nullptr}; };
    }

    /** Asks a provider something that it can only refuse, with a message by its broker. */
    CMPIStatus askWithoutKeys(CMPIInstanceMI* mi) {
        const CMPIObjectPath path{nullptr, &pathTable};
        const CMPIResult result{nullptr, &resultTable};
        return mi->ft->getInstance(mi, nullptr, &result, &path, nullptr);
    }

    CMPIObjectPathFT pathTable{};
    CMPIResultFT resultTable{};
    TinyBroker first;
    TinyBroker second;
};

const std::array<std::string, 3> PROVIDERS{"LogicalNetworkAdapterProvider", "PhysicalNetworkAdapterProvider",
                                           "NetworkAdapterProvider"};

TEST_F(Factories, CalledTwiceGiveTheSameObjectAndLeaveTheSecondBrokerInPlace) {
    for (const std::string& provider : PROVIDERS) {
        TinyBroker::asked.clear();
        CMPIInstanceMI* mi = createInstanceMI(provider, &first.broker);
        EXPECT_EQ(createInstanceMI(provider, &second.broker), mi);
        const CMPIStatus status = askWithoutKeys(mi);
        EXPECT_EQ(status.rc, CMPI_RC_ERR_FAILED);
        EXPECT_EQ(status.msg, &TinyBroker::message);
        EXPECT_THAT(TinyBroker::asked, testing::ElementsAre(&second.broker)) << provider;
        EXPECT_EQ(TinyBroker::askedFor, "At least one key should be passed");
    }
}

TEST_F(Factories, OfOneProviderShareOneBroker) {
    CMPIInstanceMI* mi = createInstanceMI("NetworkAdapterProvider", &first.broker);
    EXPECT_EQ(createMethodMI(&second.broker), createMethodMI(&second.broker));
    askWithoutKeys(mi);
    EXPECT_EQ(createIndicationMI(&first.broker), createIndicationMI(&first.broker));
    askWithoutKeys(mi);
    EXPECT_THAT(TinyBroker::asked, testing::ElementsAre(&second.broker, &first.broker));
}

TEST_F(Factories, OfDifferentProvidersDoNotShareABroker) {
    CMPIInstanceMI* logical = createInstanceMI("LogicalNetworkAdapterProvider", &first.broker);
    CMPIInstanceMI* physical = createInstanceMI("PhysicalNetworkAdapterProvider", &second.broker);
    createInstanceMI("NetworkAdapterProvider", nullptr);
    askWithoutKeys(logical);
    askWithoutKeys(physical);
    EXPECT_THAT(TinyBroker::asked, testing::ElementsAre(&first.broker, &second.broker));
}

TEST_F(Factories, WithoutBrokerTheRefusalHasNoMessage) {
    for (const std::string& provider : PROVIDERS) {
        const CMPIStatus status = askWithoutKeys(createInstanceMI(provider, nullptr));
        EXPECT_EQ(status.rc, CMPI_RC_ERR_FAILED);
        EXPECT_EQ(status.msg, nullptr);
    }
}

TEST_F(Factories, CleanupTakesNothingAway) {
    CMPIInstanceMI* mi = createInstanceMI("NetworkAdapterProvider", &first.broker);
    CMPIIndicationMI* indication = createIndicationMI(&first.broker);
    mi->ft->cleanup(mi, nullptr, 1);
    indication->ft->cleanup(indication, nullptr, 1);
    askWithoutKeys(mi);
    EXPECT_THAT(TinyBroker::asked, testing::ElementsAre(&first.broker));
    EXPECT_EQ(createInstanceMI("NetworkAdapterProvider", &second.broker), mi);
    askWithoutKeys(mi);
    EXPECT_THAT(TinyBroker::asked, testing::ElementsAre(&first.broker, &second.broker));
}

TEST_F(Factories, DoNotTouchTheirThirdArgument) {
    CMPIString text{};
    CMPIStatus status = {CMPI_RC_ERR_ACCESS_DENIED, &text};
    for (const std::string& provider : PROVIDERS) {
        EXPECT_NE(symbol<InstanceFactory>(provider + "_Create_InstanceMI")(&first.broker, nullptr, &status), nullptr);
        EXPECT_NE(symbol<InstanceFactory>(provider + "_Create_InstanceMI")(&first.broker, nullptr, nullptr), nullptr);
    }
    EXPECT_NE(symbol<MethodFactory>("NetworkAdapterProvider_Create_MethodMI")(&first.broker, nullptr, &status),
              nullptr);
    EXPECT_NE(
        symbol<IndicationFactory>("NetworkAdapterProvider_Create_IndicationMI")(&first.broker, nullptr, &status),
        nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_EQ(status.msg, &text);
}

TEST_F(Factories, ServeObjectManagersThatPassTwoArguments) {
    using OlderFactory = CMPIInstanceMI* (*)(const CMPIBroker*, const CMPIContext*);
    for (const std::string& provider : PROVIDERS) {
        EXPECT_EQ(symbol<OlderFactory>(provider + "_Create_InstanceMI")(&first.broker, nullptr),
                  createInstanceMI(provider, &first.broker));
    }
}

TEST_F(Factories, LogNothing) {
    for (const std::string& provider : PROVIDERS) {
        createInstanceMI(provider, &first.broker);
    }
    createMethodMI(&first.broker);
    createIndicationMI(&first.broker);
    EXPECT_THAT(scripted_agent::record(), IsEmpty());
}

TEST_F(Factories, GiveInstanceTablesThatAreComplete) {
    const std::array<std::string, 3> names{"instanceLogicalNetworkAdapterProvider",
                                           "instancePhysicalNetworkAdapterProvider",
                                           "instanceNetworkAdapterProvider"};
    for (std::size_t i = 0; i < PROVIDERS.size(); ++i) {
        const CMPIInstanceMI* mi = createInstanceMI(PROVIDERS.at(i), &first.broker);
        EXPECT_EQ(mi->hdl, nullptr);
        EXPECT_EQ(mi->ft->ftVersion, 200);
        EXPECT_EQ(mi->ft->miVersion, 200);
        EXPECT_EQ(mi->ft->miName, names.at(i));
        EXPECT_TRUE(mi->ft->cleanup && mi->ft->enumerateInstanceNames && mi->ft->enumerateInstances &&
                    mi->ft->getInstance && mi->ft->createInstance && mi->ft->modifyInstance &&
                    mi->ft->deleteInstance && mi->ft->execQuery);
    }
}

TEST_F(Factories, GiveAMethodTableThatIsComplete) {
    const CMPIMethodMI* mi = createMethodMI(&first.broker);
    EXPECT_EQ(mi->hdl, nullptr);
    EXPECT_EQ(mi->ft->ftVersion, 200);
    EXPECT_EQ(mi->ft->miVersion, 200);
    EXPECT_STREQ(mi->ft->miName, "methodNetworkAdapterProvider");
    EXPECT_TRUE(mi->ft->cleanup && mi->ft->invokeMethod);
}

TEST_F(Factories, GiveAnIndicationTableThatIsCompleteAndHasACapitalInItsName) {
    const CMPIIndicationMI* mi = createIndicationMI(&first.broker);
    EXPECT_EQ(mi->hdl, nullptr);
    EXPECT_EQ(mi->ft->ftVersion, 200);
    EXPECT_EQ(mi->ft->miVersion, 200);
    EXPECT_STREQ(mi->ft->miName, "IndicationNetworkAdapterProvider");
    EXPECT_TRUE(mi->ft->cleanup && mi->ft->authorizeFilter && mi->ft->mustPoll && mi->ft->activateFilter &&
                mi->ft->deActivateFilter && mi->ft->enableIndications && mi->ft->disableIndications &&
                mi->ft->authorizeFilterCollection && mi->ft->activateFilterCollection &&
                mi->ft->deActivateFilterCollection);
}

void expectStatus(const CMPIStatus& status, CMPIrc rc) {
    EXPECT_EQ(status.rc, rc);
    EXPECT_EQ(status.msg, nullptr);
    EXPECT_THAT(scripted_agent::record(), IsEmpty());
}

TEST_F(Factories, InstanceProvidersRefuseWhatChangesInstancesAndQueriesWithoutALogLine) {
    for (const std::string& provider : PROVIDERS) {
        CMPIInstanceMI* mi = createInstanceMI(provider, &first.broker);
        expectStatus(mi->ft->createInstance(mi, nullptr, nullptr, nullptr, nullptr), CMPI_RC_ERR_NOT_SUPPORTED);
        expectStatus(mi->ft->deleteInstance(mi, nullptr, nullptr, nullptr), CMPI_RC_ERR_NOT_SUPPORTED);
        expectStatus(mi->ft->execQuery(mi, nullptr, nullptr, nullptr, nullptr, nullptr), CMPI_RC_ERR_NOT_SUPPORTED);
    }
}

TEST_F(Factories, LogicalAndPhysicalProvidersRefuseToModifyWithoutALogLine) {
    for (const char* provider : {"LogicalNetworkAdapterProvider", "PhysicalNetworkAdapterProvider"}) {
        CMPIInstanceMI* mi = createInstanceMI(provider, &first.broker);
        expectStatus(mi->ft->modifyInstance(mi, nullptr, nullptr, nullptr, nullptr, nullptr),
                     CMPI_RC_ERR_NOT_SUPPORTED);
    }
}

TEST_F(Factories, InstanceAndIndicationCleanupsAnswerOKAndTheMethodCleanupDoesNot) {
    for (const CMPIBoolean terminating : {CMPIBoolean{0}, CMPIBoolean{1}}) {
        for (const std::string& provider : PROVIDERS) {
            CMPIInstanceMI* mi = createInstanceMI(provider, &first.broker);
            expectStatus(mi->ft->cleanup(mi, nullptr, terminating), CMPI_RC_OK);
        }
        CMPIIndicationMI* indication = createIndicationMI(&first.broker);
        expectStatus(indication->ft->cleanup(indication, nullptr, terminating), CMPI_RC_OK);
        CMPIMethodMI* method = createMethodMI(&first.broker);
        expectStatus(method->ft->cleanup(method, nullptr, terminating), CMPI_RC_ERR_NOT_SUPPORTED);
    }
}

TEST_F(Factories, FilterCollectionsAreNotSupported) {
    CMPIIndicationMI* mi = createIndicationMI(&first.broker);
    expectStatus(mi->ft->authorizeFilterCollection(mi, nullptr, nullptr), CMPI_RC_ERR_NOT_SUPPORTED);
    expectStatus(mi->ft->activateFilterCollection(mi, nullptr, nullptr, 1), CMPI_RC_ERR_NOT_SUPPORTED);
    expectStatus(mi->ft->deActivateFilterCollection(mi, nullptr, nullptr, 1), CMPI_RC_ERR_NOT_SUPPORTED);
}

TEST_F(Factories, MustPollMayBeCalledWithASixthArgument) {
    using SixArguments = CMPIStatus (*)(CMPIIndicationMI*, const CMPIContext*, const CMPISelectExp*, const char*,
                                        const CMPIObjectPath*, CMPIBoolean);
    CMPIIndicationMI* mi = createIndicationMI(&first.broker);
    void* slot = reinterpret_cast<void*>(mi->ft->mustPoll);
    EXPECT_EQ(reinterpret_cast<SixArguments>(slot)(mi, nullptr, nullptr, nullptr, nullptr, 1).rc, CMPI_RC_OK);
}

} // namespace
