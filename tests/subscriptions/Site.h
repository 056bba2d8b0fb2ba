/**
 * @file
 * An object manager with the shipped schema, providers of alerts and the indication service, whose delivery is
 * scripted.
 */
#pragma once

#include "host/subscriptions/Service.h"
#include "tests/broker/providers/alerts.h"
#include "tests/subscriptions/ScriptedDelivery.h"
#include "tests/support/ProviderSite.h"

#include <cstring>
#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <vector>

#include <dlfcn.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {

class SubscribingTest : public testing::Test {
  protected:
    SubscribingTest() {
        for (const char* file : {"00-qualifiers.mof", "10-core.mof", "20-marlo.mof", "40-interop.mof"}) {
            std::filesystem::copy(std::filesystem::path(MARLO_SHIPPED_SCHEMA) / file,
                                  site.directory() / "schema" / file);
        }
        std::filesystem::remove(site.directory() / "schema" / "test.mof");
        writeAlerts(true);
        site.write("providers/alerts.toml",
                   std::string("library = \"" PROVIDER_DIRECTORY "/libalert_providers.so\"\n") + R"(
[[provider]]
name = "FirstAlerts"
kinds = ["indication"]
namespaces = ["root/test"]
classes = ["Test_Alert"]
[[provider]]
name = "SecondAlerts"
kinds = ["indication"]
namespaces = ["root/tavis"]
classes = ["MARLO_NetworkAdapterOnlineEvent"]
)");
        _library = dlopen(PROVIDER_DIRECTORY "/libalert_providers.so", RTLD_NOW | RTLD_LOCAL);
        load(deliver, "alerts_deliver");
        load(misbehave, "alerts_misbehave");
        load(takeCalls, "alerts_takeCalls");
        takeCalls();
        open();
    }

    ~SubscribingTest() override {
        misbehave("FirstAlerts", "activateFilter", 0);
        misbehave("FirstAlerts", "authorizeFilter", 0);
        close();
    }

    SubscribingTest(const SubscribingTest&) = delete;
    SubscribingTest& operator=(const SubscribingTest&) = delete;

    void writeAlerts(bool withLoudOnes) const {
        site.write("schema/90-alerts.mof", std::string(R"(#pragma namespace ("root/test")
[Indication] class Test_Alert : CIM_Indication { string Text; uint32 Number; uint16 Severity; };
class Test_Thing { [Key] string Id; };
)") + (withLoudOnes ? "[Indication] class Test_LoudAlert : Test_Alert { uint16 Volume; };\n" : ""));
    }

    void open() {
        manager = site.start(PROVIDER_DIRECTORY);
        subscriptions::Options options;
        options.database = site.directory() / "marlo.db";
        options.mayRead = [this](const std::string& user) { return strangers.count(user) == 0; };
        options.trust = [this](delivery::Destination& destination) { destination.authorityFile = authorities; };
        options.log = [this](const std::string& line) {
            const std::lock_guard lock(_mutex);
            _lines.push_back(line);
        };
        service = std::make_shared<subscriptions::Service>(*manager, std::move(options));
        manager->add(service);
        service->start();
    }

    void close() {
        service->stop(std::chrono::milliseconds(0));
        service.reset();
        manager.reset();
    }

    void reopen() {
        close();
        open();
    }

    static ObjectPath parse(const std::string& text) { return ObjectPath::parse(text); }

    /** Creates an instance; the path of what came of it. */
    ObjectPath make(const std::string& className, const std::vector<NamedValue>& properties) {
        ObjectPath created;
        const Status status = tryToMake(className, properties, created);
        EXPECT_TRUE(status.ok()) << status.message;
        return created;
    }

    Status tryToMake(const std::string& className, const std::vector<NamedValue>& properties, ObjectPath& created) {
        return manager->createInstance({{"", "root/interop", className, {}}, properties}, created);
    }

    Status tryToMake(const std::string& className, const std::vector<NamedValue>& properties) {
        ObjectPath created;
        return tryToMake(className, properties, created);
    }

    static NamedValue text(const std::string& name, const std::string& value) { return {name, Value::string(value)}; }

    static NamedValue number(const std::string& name, std::uint64_t value) {
        return {name, Value::uint(CMPI_uint64, value)};
    }

    static NamedValue reference(const std::string& name, const ObjectPath& path) {
        return {name, {CMPI_ref, std::make_shared<const ObjectPath>(path)}};
    }

    ObjectPath makeFilter(const std::string& name = "filter", const std::string& query = "SELECT * FROM Test_Alert") {
        return make("CIM_IndicationFilter", {text("Name", name), text("Query", query), text("QueryLanguage", "WQL"),
                                             text("SourceNamespace", "root/test")});
    }

    ObjectPath makeDestination(const std::string& name = "listener",
                               const std::string& url = "http://127.0.0.1:5990/sink") {
        return make("CIM_ListenerDestinationCIMXML", {text("Name", name), text("Destination", url)});
    }

    ObjectPath subscribe(const ObjectPath& filter, const ObjectPath& destination,
                         std::vector<NamedValue> properties = {}) {
        properties.push_back(reference("Filter", filter));
        properties.push_back(reference("Handler", destination));
        return make("CIM_IndicationSubscription", properties);
    }

    Instance get(const ObjectPath& path) {
        Instance found;
        const Status status =
            manager->getInstance(path, std::nullopt, [&found](Instance&& instance) { found = std::move(instance); });
        EXPECT_TRUE(status.ok()) << status.message;
        return found;
    }

    CMPIrc codeOfGet(const ObjectPath& path) {
        return manager->getInstance(path, std::nullopt, [](Instance&&) {}).code;
    }

    Status set(const ObjectPath& path, const NamedValue& property) {
        return manager->modifyInstance({path, {property}}, std::vector<std::string>{property.name});
    }

    std::vector<std::string> names(const std::string& className) {
        std::vector<std::string> found;
        const Status status = manager->enumerateInstanceNames(
            "root/interop", className, [&found](ObjectPath&& path) { found.push_back(path.toString()); });
        EXPECT_TRUE(status.ok()) << status.message;
        return found;
    }

    static std::uint64_t stateOf(const Instance& subscription) {
        return subscriptions::numberOf(subscription, "SubscriptionState").value_or(0);
    }

    /** Numbers of the alerts that were posted, in order. */
    static std::vector<std::uint64_t> postedNumbers() {
        std::vector<std::uint64_t> numbers;
        for (const auto& [subscription, indication] : ScriptedDelivery::latest().posted()) {
            numbers.push_back(subscriptions::numberOf(indication, "Number").value_or(~std::uint64_t{0}));
        }
        return numbers;
    }

    std::vector<std::string> lines() {
        const std::lock_guard lock(_mutex);
        return _lines;
    }

    ProviderSite site;
    std::set<std::string> strangers; ///< users who may not read
    std::string authorities;         ///< file for the certificates of all destinations
    std::unique_ptr<ObjectManager> manager;
    std::shared_ptr<subscriptions::Service> service;

    decltype(&alerts_deliver) deliver = nullptr;
    decltype(&alerts_misbehave) misbehave = nullptr;
    decltype(&alerts_takeCalls) takeCalls = nullptr;

  private:
    template <typename Function>
    void load(Function& function, const char* name) {
        void* found = _library == nullptr ? nullptr : dlsym(_library, name);
        if (found == nullptr) {
            throw std::runtime_error(std::string("no ") + name + ": " + dlerror());
        }
        std::memcpy(&function, &found, sizeof function);
    }

    void* _library = nullptr; // stays mapped, as providers do
    std::mutex _mutex;
    std::vector<std::string> _lines;
};

} // namespace marlo::test
