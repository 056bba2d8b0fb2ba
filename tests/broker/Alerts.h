/**
 * @file
 * An object manager over the providers of alerts.
 */
#pragma once

#include "tests/broker/providers/alerts.h"
#include "tests/support/ProviderSite.h"

#include <cstring>
#include <sstream>

#include <dlfcn.h>
#include <gtest/gtest.h>

namespace marlo::test {

constexpr const char* alertClasses = R"(
Qualifier Abstract : boolean = false, Scope(class, association, indication), Flavor(Restricted);
Qualifier Indication : boolean = false, Scope(class, indication), Flavor(DisableOverride);
#pragma namespace ("root/test")
[Indication, Abstract] class Test_Indication { datetime IndicationTime; };
[Indication] class Test_Alert : Test_Indication { string Text; uint32 Number; uint16 Severity; string List[]; };
[Indication] class Test_LoudAlert : Test_Alert { uint16 Volume; };
[Indication] class Test_QuietAlert : Test_Alert { };
[Indication] class Test_Other : Test_Indication { };
)";

/** What a sink was given. */
class Mailbox {
  public:
    ObjectManager::IndicationSink sink() {
        return [this](Instance&& indication) {
            const std::lock_guard lock(_mutex);
            _received.push_back(std::move(indication));
        };
    }

    [[nodiscard]] std::vector<Instance> received() const {
        const std::lock_guard lock(_mutex);
        return _received;
    }

    /** The values of Number, in order. */
    [[nodiscard]] std::vector<unsigned> numbers() const {
        std::vector<unsigned> numbers;
        for (const Instance& each : received()) {
            const NamedValue* number = findName(each.properties, "Number");
            numbers.push_back(number == nullptr ? ~0U
                                                : static_cast<unsigned>(std::get<std::uint64_t>(number->value.data)));
        }
        return numbers;
    }

  private:
    mutable std::mutex _mutex;
    std::vector<Instance> _received;
};

class AlertsTest : public testing::Test {
  protected:
    AlertsTest() {
        site.write("schema/alerts.mof", alertClasses);
        const char* library = PROVIDER_DIRECTORY "/libalert_providers.so";
        _library = dlopen(library, RTLD_NOW | RTLD_LOCAL);
        load(takeCalls, "alerts_takeCalls");
        load(misbehave, "alerts_misbehave");
        load(deliver, "alerts_deliver");
        load(burst, "alerts_burst");
        load(hold, "alerts_hold");
        load(ended, "alerts_ended");
        load(failed, "alerts_failed");
        takeCalls();
        hold(0);
    }

    ~AlertsTest() override {
        for (const std::string& key : _misbehaving) {
            const std::size_t at = key.find('.');
            misbehave(key.substr(0, at).c_str(), key.substr(at + 1).c_str(), 0);
        }
        manager.reset();
    }

    AlertsTest(const AlertsTest&) = delete;
    AlertsTest& operator=(const AlertsTest&) = delete;

    /** Registers a provider for classes and starts the object manager anew. */
    void provide(const std::string& provider, const std::string& classes) {
        site.write("providers/" + provider + ".toml",
                   "library = \"libalert_providers.so\"\n[[provider]]\nname = \"" + provider +
                       "\"\nkinds = [\"indication\"]\nnamespaces = [\"root/test\"]\nclasses = [" + classes + "]\n");
        manager = site.start(PROVIDER_DIRECTORY);
    }

    Status subscribe(const std::string& filter, Mailbox& mailbox, SubscriptionId& id) {
        return manager->subscribe("root/test", filter, "WQL", mailbox.sink(), id);
    }

    /** For a subscription that must succeed. */
    SubscriptionId subscribe(const std::string& filter, Mailbox& mailbox) {
        SubscriptionId id = 0;
        const Status status = subscribe(filter, mailbox, id);
        EXPECT_TRUE(status.ok()) << status.message;
        EXPECT_NE(id, 0U);
        return id;
    }

    /** Lets a function of a provider fail (1) or throw (2) until the test ends. */
    void letMisbehave(const std::string& provider, const std::string& function, int mode) {
        _misbehaving.push_back(provider + "." + function);
        misbehave(provider.c_str(), function.c_str(), mode);
    }

    /** The calls since the last time. */
    std::vector<std::string> calls() {
        std::vector<std::string> lines;
        std::istringstream stream(takeCalls());
        for (std::string line; std::getline(stream, line);) {
            lines.push_back(line);
        }
        return lines;
    }

    ProviderSite site;
    std::unique_ptr<ObjectManager> manager;

    decltype(&alerts_takeCalls) takeCalls = nullptr;
    decltype(&alerts_misbehave) misbehave = nullptr;
    decltype(&alerts_deliver) deliver = nullptr;
    decltype(&alerts_burst) burst = nullptr;
    decltype(&alerts_hold) hold = nullptr;
    decltype(&alerts_ended) ended = nullptr;
    decltype(&alerts_failed) failed = nullptr;

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
    std::vector<std::string> _misbehaving;
};

} // namespace marlo::test
