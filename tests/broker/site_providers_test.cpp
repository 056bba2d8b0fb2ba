/** @file Providers of all sorts, and where they and their classes come from. */
#include "tests/support/ProviderSite.h"

#include <atomic>
#include <filesystem>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

constexpr const char* itemClasses = R"(
Qualifier Association : boolean = false, Scope(association), Flavor(DisableOverride);
Qualifier In : boolean = true, Scope(parameter), Flavor(DisableOverride);
Qualifier Indication : boolean = false, Scope(class, indication), Flavor(DisableOverride);
Qualifier Out : boolean = false, Scope(parameter), Flavor(DisableOverride);
Qualifier Write : boolean = false, Scope(property, reference);
#pragma namespace ("root/test")
class Test_Item { [Key] string Id; [Write] uint16 Count = 5; string Principal; };
class Test_Caller { [Key] string Id; uint32 Call([In] string What, [In(false), Out] string Answer); };
[Association] class Test_Pair { [Key] Test_Item REF Left; [Key] Test_Item REF Right; };
[Indication] class Test_Event { string Text; };
)";

std::string item(const std::string& id) {
    return "root/test:Test_Item.Id=\"" + id + "\"";
}

class Items : public testing::Test {
  protected:
    Items() { site.write("schema/zz-items.mof", itemClasses); }

    void provide(const std::string& provider, const std::string& className,
                 const std::vector<std::string>& kinds = {"instance"}) const {
        site.provide("libstore_providers.so", provider, className, kinds);
    }

    ObjectManager& manager() {
        if (!_manager) {
            _manager = site.start(PROVIDER_DIRECTORY);
        }
        return *_manager;
    }

    Status create(const std::string& id) {
        ObjectPath path{"", "root/test", "Test_Item", {}};
        if (!id.empty()) {
            path.keys.push_back({"Id", Value::string(id)});
        }
        return manager().createInstance({path, {}}, created);
    }

    Status remove(const std::string& id) { return manager().deleteInstance(ObjectPath::parse(item(id))); }

    std::vector<std::string> paths() {
        std::vector<std::string> found;
        const Status status = manager().enumerateInstanceNames(
            "root/test", "Test_Item", [&found](ObjectPath&& path) { found.push_back(path.toString()); });
        EXPECT_TRUE(status.ok()) << status.message;
        return found;
    }

    std::string property(const std::string& id, const std::string& name) {
        std::string text = "absent";
        const Status status =
            manager().getInstance(ObjectPath::parse(item(id)), std::vector<std::string>{name},
                                  [&text](Instance&& instance) { text = toText(instance.properties.at(0).value); });
        EXPECT_TRUE(status.ok()) << status.message;
        return text;
    }

    /** What the caller's up-call came to. */
    std::string call(const std::string& what) {
        MethodAnswer answer;
        const Status status = manager().invokeMethod(ObjectPath::parse("root/test:Test_Caller.Id=\"x\""), "Call",
                                                     {{"What", Value::string(what)}}, answer);
        EXPECT_TRUE(status.ok()) << status.message;
        return answer.out.empty() ? "" : std::get<std::string>(answer.out.at(0).value.data);
    }

    static void expect(const Status& status, CMPIrc code, const std::string& message) {
        EXPECT_EQ(status.code, code) << status.message;
        EXPECT_THAT(status.message, HasSubstr(message));
    }

    ProviderSite site;
    ObjectPath created;

  private:
    std::unique_ptr<ObjectManager> _manager;
};

TEST_F(Items, AreMadeChangedAndDeletedThroughTheProvider) {
    provide("Store", "Test_Item");
    ASSERT_TRUE(create("a").ok());
    EXPECT_EQ(created.toString(), item("a")) << "namespace and no host";
    EXPECT_EQ(property("a", "Count"), "5") << "the default";
    ASSERT_TRUE(
        manager()
            .modifyInstance({ObjectPath::parse(item("a")), {{"Count", Value::uint(CMPI_uint16, 9)}}}, std::nullopt)
            .ok());
    EXPECT_EQ(property("a", "Count"), "9");
    ASSERT_TRUE(remove("a").ok());
    EXPECT_THAT(paths(), IsEmpty());
}

TEST_F(Items, GetKeysFromTheProviderThatWereNotGiven) {
    provide("Store", "Test_Item");
    ASSERT_TRUE(create("").ok());
    EXPECT_EQ(created.toString(), item("given"));
}

TEST_F(Items, AreMadeByAProviderThatReturnsNoPath) {
    provide("Store", "Test_Item");
    ASSERT_TRUE(create("silent").ok());
    EXPECT_EQ(created.toString(), item("silent"));
}

TEST_F(Items, KeepTheBytesOfTheirTextsWhateverTheyAre) {
    provide("Store", "Test_Item");
    const std::string odd = "\xff\xc3 \x01";
    ASSERT_TRUE(create(odd).ok());
    EXPECT_THAT(paths(), ElementsAre(item(odd)));
    EXPECT_EQ(property(odd, "Id"), '"' + odd + '"');
    EXPECT_TRUE(remove(odd).ok());
}

TEST_F(Items, FailuresToMakeAndDeleteThemAreAnswered) {
    provide("Store", "Test_Item");
    ASSERT_TRUE(create("a").ok());
    expect(create("a"), CMPI_RC_ERR_ALREADY_EXISTS, "there is one already");
    EXPECT_EQ(created, ObjectPath{});
    expect(create("throws"), CMPI_RC_ERR_FAILED, "provider Store threw: the text of the exception");
    expect(remove("none"), CMPI_RC_ERR_NOT_FOUND, "no such item");
    expect(remove("throws"), CMPI_RC_ERR_FAILED, "provider Store threw: the text of the exception");
    EXPECT_THAT(paths(), ElementsAre(item("a")));
}

TEST_F(Items, NotSupportedOfAProviderIsAnsweredAsThat) {
    site.provide("libthing_provider.so", "ThingProvider", "Test_Thing");
    expect(manager().createInstance({{"", "root/test", "Test_Thing", {}}, {}}, created), CMPI_RC_ERR_NOT_SUPPORTED,
           "provider ThingProvider does not support this");
    expect(manager().deleteInstance(ObjectPath::parse("root/test:Test_Thing.Id=\"a\",Number=1")),
           CMPI_RC_ERR_NOT_SUPPORTED, "ThingProvider");
}

TEST_F(Items, ProviderHearsInWhoseNameItIsAsked) {
    provide("Store", "Test_Item");
    ASSERT_TRUE(create("a").ok());
    const std::string processUser = property("a", "Principal");
    {
        const ActingFor outer("alice");
        EXPECT_EQ(property("a", "Principal"), "\"alice\"");
        {
            const ActingFor inner("bob");
            EXPECT_EQ(property("a", "Principal"), "\"bob\"");
        }
        EXPECT_EQ(property("a", "Principal"), "\"alice\"");
        std::string elsewhere;
        std::thread([&] { elsewhere = property("a", "Principal"); }).join();
        EXPECT_EQ(elsewhere, processUser) << "another thread acts for itself";
    }
    EXPECT_EQ(property("a", "Principal"), processUser);
    EXPECT_NE(processUser, "\"\"");
}

class UpCalls : public Items {
  protected:
    UpCalls() {
        provide("Store", "Test_Item");
        provide("Pairs", "Test_Pair");
        provide("Caller", "Test_Caller", {"method"});
    }
};

TEST_F(UpCalls, MakeChangeAndDelete) {
    EXPECT_EQ(call("create"), item("made"));
    EXPECT_EQ(property("made", "Count"), "8");
    EXPECT_THAT(call("create"), HasSubstr("status 11 there is one already"));
    EXPECT_THAT(call("modify"), HasSubstr("status 6 "));
    ASSERT_TRUE(create("a").ok());
    EXPECT_EQ(call("modify"), "status 0 NULL");
    EXPECT_EQ(property("a", "Count"), "8");
    EXPECT_EQ(call("delete"), "status 0 NULL");
    EXPECT_EQ(call("delete"), "status 6 no such item");
}

TEST_F(UpCalls, GetAndSetOneProperty) {
    ASSERT_TRUE(create("a").ok());
    EXPECT_EQ(call("get"), "5");
    EXPECT_EQ(call("set"), "status 0 NULL");
    EXPECT_EQ(call("get"), "8");
    ASSERT_TRUE(remove("a").ok());
    EXPECT_THAT(call("get"), HasSubstr("status 6 "));
}

TEST_F(UpCalls, QueryAndInvoke) {
    ASSERT_TRUE(create("a").ok());
    EXPECT_EQ(call("query"), item("a"));
    EXPECT_EQ(call("invoke"), "0 asked for nothing");
}

TEST_F(UpCalls, FollowAssociations) {
    ASSERT_TRUE(create("b").ok());
    EXPECT_EQ(call("associators"), item("b"));
    EXPECT_EQ(call("associatorNames"), item("b"));
    EXPECT_THAT(call("references"), HasSubstr("root/test:Test_Pair.Left=\"root/test:Test_Item.Id=\\\"a\\\"\""));
    EXPECT_EQ(call("referenceNames"), "") << "a is not at the right end";
}

TEST_F(Items, FunctionsThatATableLeavesOutAreNotSupported) {
    provide("Bare", "Test_Item");
    const auto expectNone = [](const Status& status) {
        expect(status, CMPI_RC_ERR_NOT_SUPPORTED, "provider Bare does not support this");
    };
    const ObjectPath path = ObjectPath::parse(item("a"));
    expectNone(manager().enumerateInstances("root/test", "Test_Item", std::nullopt, [](Instance&&) {}));
    expectNone(manager().enumerateInstanceNames("root/test", "Test_Item", [](ObjectPath&&) {}));
    expectNone(manager().getInstance(path, std::nullopt, [](Instance&&) {}));
    expectNone(manager().modifyInstance({path, {}}, std::nullopt));
    expectNone(create("a"));
    expectNone(remove("a"));
}

TEST_F(Items, MethodThatATableLeavesOutIsNotSupported) {
    provide("Bare", "Test_Caller", {"method"});
    MethodAnswer answer;
    expect(manager().invokeMethod(ObjectPath::parse("root/test:Test_Caller.Id=\"x\""), "Call", {}, answer),
           CMPI_RC_ERR_NOT_SUPPORTED, "provider Bare does not support this");
}

TEST_F(Items, IndicationsOfATableWithoutActivationAreNotSupported) {
    provide("Bare", "Test_Event", {"indication"});
    SubscriptionId id = 0;
    expect(manager().subscribe(
               "root/test", "SELECT * FROM Test_Event", "WQL", [](Instance&&) {}, id),
           CMPI_RC_ERR_NOT_SUPPORTED, "activateFilter of provider Bare for Test_Event");
    EXPECT_EQ(id, 0U);
}

TEST_F(Items, TablesOfTheFirstAndOfALaterVersionAreUsed) {
    for (const char* provider : {"First", "Later"}) {
        ProviderSite other;
        other.write("schema/zz-items.mof", itemClasses);
        other.provide("libstore_providers.so", provider, "Test_Item");
        EXPECT_TRUE(other.start(PROVIDER_DIRECTORY)
                        ->enumerateInstances("root/test", "Test_Item", std::nullopt, [](Instance&&) {})
                        .ok())
            << provider;
    }
}

TEST_F(Items, TableOfAnOlderVersionIsRefused) {
    provide("Older", "Test_Item");
    expect(create("a"), CMPI_RC_ERR_FAILED, "whose function table is of version 90, and not of 100 or later");
}

TEST_F(Items, InterfaceWithoutATableIsRefused) {
    provide("Tableless", "Test_Item");
    expect(create("a"), CMPI_RC_ERR_FAILED, "made an interface without a function table");
}

TEST_F(Items, AreMadeAndDeletedByManyThreads) {
    provide("Store", "Test_Item");
    provide("Caller", "Test_Caller", {"method"});
    manager();
    std::vector<std::thread> threads;
    std::atomic<int> wrong{0};
    for (int thread = 0; thread < 4; ++thread) {
        threads.emplace_back([this, thread, &wrong] {
            const ActingFor acting("user" + std::to_string(thread));
            ObjectPath made;
            for (int round = 0; round < 20; ++round) {
                const ObjectPath path = ObjectPath::parse(item(std::to_string(thread)));
                wrong += manager().createInstance({path, {}}, made).ok() && made == path ? 0 : 1;
                wrong +=
                    property(std::to_string(thread), "Principal") == "\"user" + std::to_string(thread) + '"' ? 0 : 1;
                wrong += call("nothing") == "asked for nothing" ? 0 : 1;
                wrong += manager().deleteInstance(path).ok() ? 0 : 1;
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(wrong, 0);
}

/** A second site: directories of its own beside the first one's. */
class SecondSite : public Items {
  protected:
    SecondSite() {
        std::filesystem::remove(other.directory() / "schema/test.mof");
        options.schemaDirectories = {(site.directory() / "schema").string(), (other.directory() / "schema").string()};
        options.providerDirectories = {(site.directory() / "providers").string(),
                                       (other.directory() / "providers").string()};
        options.libraryDirectory = PROVIDER_DIRECTORY;
        options.log = [](const std::string&) {};
        other.write("schema/derived.mof", "#pragma namespace (\"root/test\")\n"
                                          "class Site_Thing : Test_Thing { string Colour; };");
    }

    std::vector<std::string> thingPaths() {
        std::vector<std::string> found;
        ObjectManager second(options);
        const Status status = second.enumerateInstanceNames(
            "root/test", "Test_Base", [&found](ObjectPath&& path) { found.push_back(path.toString()); });
        EXPECT_TRUE(status.ok()) << status.message;
        return found;
    }

    ProviderSite other;
    ObjectManagerOptions options;
};

const std::string siteThing = "root/test:Site_Thing.Id=\"a\",Number=1";

TEST_F(SecondSite, ServesClassesThatDeriveFromTheFirstOnes) {
    site.provide("libthing_provider.so", "ThingProvider", "Test_Thing");
    other.provide("libthing_provider.so", "SubThingProvider", "Site_Thing");
    EXPECT_THAT(thingPaths(),
                ElementsAre("root/test:Test_Thing.Id=\"a\",Number=1", "root/test:Test_Thing.Id=\"b\",Number=2",
                            siteThing, "root/test:Site_Thing.Id=\"b\",Number=2"));
}

TEST_F(SecondSite, NamesALibraryByItsWholePath) {
    other.provide(PROVIDER_DIRECTORY "/libthing_provider.so", "ThingProvider", "Site_Thing");
    options.libraryDirectory = "/nonexistent";
    EXPECT_THAT(thingPaths(), testing::Contains(siteThing));
}

TEST_F(SecondSite, KeepsALibraryBesideItsRegistration) {
    other.provide("libthing_provider.so", "ThingProvider", "Site_Thing");
    std::filesystem::copy(PROVIDER_DIRECTORY "/libthing_provider.so", other.directory() / "providers");
    options.libraryDirectory = "/nonexistent";
    EXPECT_THAT(thingPaths(), testing::Contains(siteThing));
}

TEST_F(SecondSite, IsRefusedAClassThatTheFirstOneServes) {
    site.provide("libthing_provider.so", "ThingProvider", "Test_Thing");
    other.provide("libthing_provider.so", "SubThingProvider", "Test_Thing");
    EXPECT_THROW(ObjectManager{options}, std::runtime_error);
}

TEST_F(SecondSite, NeedsNoSchemaOfItsOwnButADirectory) {
    std::filesystem::remove(other.directory() / "schema/derived.mof");
    site.provide("libthing_provider.so", "ThingProvider", "Test_Thing");
    EXPECT_EQ(thingPaths().size(), 2U);
    options.schemaDirectories.emplace_back("/nonexistent");
    EXPECT_THROW(ObjectManager{options}, std::runtime_error);
}

TEST_F(Items, AreGotByTheirVeryClassAndNotByASuperclass) {
    site.provide("libthing_provider.so", "SubThingProvider", "Test_SubThing");
    const auto get = [this](const std::string& className) {
        return manager().getInstance(ObjectPath::parse("root/test:" + className + ".Id=\"a\",Number=1"), std::nullopt,
                                     [](Instance&&) {});
    };
    EXPECT_TRUE(get("Test_SubThing").ok());
    expect(get("Test_Thing"), CMPI_RC_ERR_NOT_SUPPORTED, "the instances of Test_Thing");
}

} // namespace
} // namespace marlo::test
