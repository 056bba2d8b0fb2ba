/** @file Changes of adapters through the object manager, the real provider and the real agent, on a described host.
 */
#include "host/cimom/ObjectManager.h"
#include "tests/support/Adapters.h"
#include "tests/support/DescribedHost.h"

#include <atomic>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using Values = std::vector<NamedValue>;

const std::string ClassName = "MARLO_NetworkAdapterConfiguration";

const std::string ThreeAdapters = std::string(controllerAdapter) + R"([[adapter]]
identity = "eth0"
dhcp = 3
ipv4_address = "192.0.2.10"
ipv4_subnet_mask = "255.255.255.0"
default_gateway = "192.0.2.1"
dns_servers = ["192.0.2.53"]

[[adapter]]
identity = "eth1"
dhcp = 1
ipv4_address = "203.0.113.10"
ipv4_subnet_mask = "255.255.255.0"
)";

Value texts(const std::vector<std::string>& elements) {
    Value::Array array;
    for (const std::string& element : elements) {
        array.push_back(Value::string(element));
    }
    return {CMPI_stringA, array};
}

ObjectPath pathOf(const std::string& adapter) {
    return {"", "root/tavis", ClassName, {{"SettingID", Value::string(adapter)}}};
}

class AdapterChanges : public testing::Test {
  protected:
    AdapterChanges() {
        describeHost(ThreeAdapters);
        ObjectManagerOptions options;
        options.schemaDirectories = {MARLO_SHARE "/schema"};
        options.providerDirectories = {MARLO_SHARE "/providers"};
        options.libraryDirectory = MARLO_LIBRARIES;
        options.log = [](const std::string&) {};
        manager = std::make_unique<ObjectManager>(options);
    }

    Instance read(const std::string& adapter) {
        Instance found;
        const Status status = manager->getInstance(pathOf(adapter), std::nullopt,
                                                   [&](Instance&& instance) { found = std::move(instance); });
        EXPECT_TRUE(status.ok()) << status.message;
        return found;
    }

    Value get(const std::string& adapter, const std::string& property) {
        const Instance instance = read(adapter);
        const NamedValue* found = findName(instance.properties, property);
        return found == nullptr ? Value{} : found->value;
    }

    Status invoke(const std::string& adapter, const std::string& method, const Values& arguments = {}) {
        MethodAnswer answer;
        const Status status = manager->invokeMethod(pathOf(adapter), method, arguments, answer);
        if (status.ok()) {
            EXPECT_EQ(answer.returned, Value::uint(CMPI_uint32, 0));
            EXPECT_THAT(answer.out, IsEmpty());
        }
        return status;
    }

    Status modify(const std::string& adapter, const Values& values) {
        return manager->modifyInstance({pathOf(adapter), values}, std::nullopt);
    }

    static void expectGood(const Status& status) {
        EXPECT_TRUE(status.ok()) << status.message;
        EXPECT_THAT(status.reported, IsEmpty());
    }

    std::unique_ptr<ObjectManager> manager;
};

TEST_F(AdapterChanges, EveryMethodIsSeenByTheNextReader) {
    expectGood(invoke("eth1", "EnableStatic",
                      {{"IPAddress", texts({"203.0.113.20"})}, {"SubnetMask", texts({"255.255.255.128"})}}));
    EXPECT_EQ(get("eth1", "IPAddress"), texts({"203.0.113.20"}));
    EXPECT_EQ(get("eth1", "IPSubnet"), texts({"255.255.255.128"}));
    EXPECT_EQ(get("eth1", "DHCPEnabled"), Value::boolean(false));
    expectGood(invoke("eth1", "SetGateways", {{"DefaultIPGateway", texts({"203.0.113.1"})}}));
    EXPECT_EQ(get("eth1", "DefaultIPGateway"), texts({"203.0.113.1"}));
    expectGood(invoke("eth1", "SetDNSDomain", {{"DNSDomain", Value::string("example.org")}}));
    EXPECT_EQ(get("eth1", "DNSDomain"), Value::string("example.org"));
    expectGood(invoke("eth1", "EnableDHCP"));
    EXPECT_EQ(get("eth1", "DHCPEnabled"), Value::boolean(true));
}

TEST_F(AdapterChanges, AddressAndMaskMayBeInEitherParameter) {
    expectGood(invoke("eth0", "EnableStatic",
                      {{"IPAddress", texts({"255.255.0.0"})}, {"SubnetMask", texts({"192.0.2.30"})}}));
    EXPECT_EQ(get("eth0", "IPAddress"), texts({"192.0.2.30"}));
    EXPECT_EQ(get("eth0", "IPSubnet"), texts({"255.255.0.0"}));
}

TEST_F(AdapterChanges, SearchOrdersGoToTheFirstAdapterOfTheHostFromAnyPathAndFromTheClass) {
    expectGood(
        invoke("eth1", "SetDNSServerSearchOrder", {{"DNSServerSearchOrder", texts({"192.0.2.54", "192.0.2.55"})}}));
    EXPECT_EQ(get("eth0", "DNSServerSearchOrder"), texts({"192.0.2.54", "192.0.2.55"}));
    EXPECT_TRUE(get("eth1", "DNSServerSearchOrder").isNull());
    MethodAnswer answer;
    expectGood(manager->invokeMethod({"", "root/tavis", ClassName, {}}, "SetDNSSuffixSearchOrder",
                                     {{"DNSDomainSuffixSearchOrder", texts({"example.net"})}}, answer));
    EXPECT_EQ(get("eth0", "DNSDomainSuffixSearchOrder"), texts({"example.net"}));
}

TEST_F(AdapterChanges, PropertiesAreWrittenWithoutADomainToo) {
    expectGood(modify("eth0", {{"IPv4Address", texts({"192.0.2.40"})}, {"SubnetMask", texts({"255.255.255.192"})}}));
    EXPECT_EQ(get("eth0", "IPAddress"), texts({"192.0.2.40"}));
    EXPECT_EQ(get("eth0", "IPSubnet"), texts({"255.255.255.192"}));
    expectGood(modify("eth0", {{"DNSDomain", Value::string("example.com")}}));
    EXPECT_EQ(get("eth0", "DNSDomain"), Value::string("example.com"));
    EXPECT_EQ(get("eth0", "IPAddress"), texts({"192.0.2.40"}));
}

TEST_F(AdapterChanges, InstanceThatWasReadIsSentBackChanged) {
    Instance instance = read("eth0");
    for (NamedValue& property : instance.properties) {
        if (property.name == "DefaultIPGateway") {
            property.value = texts({"192.0.2.2"});
        }
    }
    expectGood(manager->modifyInstance(instance, std::nullopt));
    EXPECT_EQ(get("eth0", "DefaultIPGateway"), texts({"192.0.2.2"}));
}

TEST_F(AdapterChanges, RefusalOfTheAgentIsAFailureWithItsReason) {
    for (const Status& status : {invoke("eth0", "SetGateways", {{"DefaultIPGateway", texts({"203.0.113.1"})}}),
                                 modify("eth0", {{"DefaultIPGateway", texts({"203.0.113.1"})}})}) {
        EXPECT_EQ(status.code, CMPI_RC_ERR_FAILED);
        EXPECT_THAT(status.message, HasSubstr("eth0: DefaultIPGateway cannot be set to \"203.0.113.1\""));
        EXPECT_THAT(status.message, HasSubstr("Caught Exception"));
        EXPECT_THAT(status.reported, Not(IsEmpty()));
    }
    EXPECT_EQ(get("eth0", "DefaultIPGateway"), texts({"192.0.2.1"}));
}

TEST_F(AdapterChanges, UnknownAdapterFailsForMethodsWithTheReasonThatTheProviderLogged) {
    const Status status = invoke("eth9", "EnableDHCP");
    EXPECT_EQ(status.code, CMPI_RC_ERR_FAILED);
    EXPECT_THAT(status.message, HasSubstr("Failed to find the SettingID in the Map"));
    EXPECT_EQ(invoke("usb0", "EnableDHCP").code, CMPI_RC_ERR_FAILED) << "the management controller's is not offered";
}

TEST_F(AdapterChanges, TheOtherClassesRefuseToBeChanged) {
    const Status physical = manager->modifyInstance(
        {{"",
          "root/tavis",
          "MARLO_PhysicalNetworkAdapter",
          {{"CreationClassName", Value::string("MARLO_PhysicalNetworkAdapter")}, {"Tag", Value::string("eth0")}}},
         {}},
        std::nullopt);
    EXPECT_EQ(physical.code, CMPI_RC_ERR_NOT_SUPPORTED) << physical.message;
    MethodAnswer answer;
    EXPECT_EQ(
        manager->invokeMethod({"", "root/tavis", "MARLO_PhysicalNetworkAdapter", {}}, "EnableDHCP", {}, answer).code,
        CMPI_RC_ERR_METHOD_NOT_FOUND);
}

TEST_F(AdapterChanges, WritersOfTwoAdaptersAndReadersRunAtTheSameTime) {
    expectGood(invoke("eth1", "EnableStatic", {{"IPAddress", texts({"203.0.113.20"})}}));
    std::atomic<int> wrong = 0;
    constexpr int rounds = 20;
    const auto write = [&](const std::string& adapter, const std::string& network) {
        for (int i = 0; i < rounds; ++i) {
            const std::string address = network + std::to_string(100 + i);
            wrong += invoke(adapter, "EnableStatic", {{"IPAddress", texts({address})}}).ok() ? 0 : 1;
            wrong += modify(adapter, {{"DNSDomain", Value::string(adapter + ".example")}}).ok() ? 0 : 1;
        }
    };
    const auto enumerate = [&] {
        for (int i = 0; i < rounds; ++i) {
            int seen = 0;
            const Status status =
                manager->enumerateInstances("root/tavis", ClassName, std::nullopt, [&seen](Instance&&) { ++seen; });
            wrong += status.ok() && seen == 2 ? 0 : 1;
        }
    };
    std::vector<std::thread> threads;
    threads.emplace_back(write, "eth0", "192.0.2.");
    threads.emplace_back(write, "eth1", "203.0.113.");
    threads.emplace_back(enumerate);
    threads.emplace_back(enumerate);
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(wrong, 0);
    EXPECT_EQ(get("eth0", "IPAddress"), texts({"192.0.2.119"}));
    EXPECT_EQ(get("eth1", "IPAddress"), texts({"203.0.113.119"}));
    EXPECT_EQ(get("eth0", "DNSDomain"), Value::string("eth0.example"));
    EXPECT_EQ(get("eth1", "DNSDomain"), Value::string("eth1.example"));
}

} // namespace
} // namespace marlo::test
