#include "tests/platform/PlatformProvider.h"

#include <atomic>
#include <thread>

#include <unistd.h>

namespace marlo::test {
namespace {

constexpr const char* cardClass = "TAVIS_NetworkCard";
constexpr const char* portClass = "TAVIS_NetworkPort";

constexpr const char* description = R"(
[[card]]
name = "eth0"
status = "OK"
element_name = "Maker Model"
description = "Maker Model\u0007 in slot 2"
serial_number = "S1"
package_type = 9

[[card]]
name = "usb0"
management_controller = true

[[port]]
identity = "eth0"
card = "eth0"
status = "OK"
element_name = "first"
caption = "a port"
description = "the first port"
speed = 10000000000
max_speed = 25000000000
requested_speed = 10000000000
port_type = 53
port_number = 0
permanent_address = "02005E000001"
full_duplex = true
auto_sense = false
link_technology = 2

[[port]]
identity = "usb0"
card = "usb0"
chassis = "BMC"

[[port]]
identity = "br0"
)";

Value text(const std::string& value) {
    return Value::string(value);
}

std::string hostName() {
    std::string name(1025, '\0');
    EXPECT_EQ(gethostname(name.data(), name.size() - 1), 0);
    return name.c_str();
}

TEST(PlatformCards, HaveAllTheirProperties) {
    const DescribedHost host(description);
    const Answer answer = PlatformProvider(cardClass).instances();
    ASSERT_EQ(answer.code, CMPI_RC_OK) << answer.message;
    EXPECT_TRUE(answer.done);
    ASSERT_EQ(answer.instances.size(), 2U);
    const std::vector<NamedValue> expected{{"CreationClassName", text(cardClass)},
                                           {"Tag", text("eth0")},
                                           {"Name", text("eth0")},
                                           {"Status", text("OK")},
                                           {"ElementName", text("Maker Model")},
                                           {"Description", text("Maker Model  in slot 2")},
                                           {"SerialNumber", text("S1")},
                                           {"PackageType", Value::uint(CMPI_uint16, 9)}};
    EXPECT_EQ(answer.instances[0].properties, expected);
}

TEST(PlatformCards, OfTheManagementControllerAreNamedNic1) {
    const DescribedHost host(description);
    const Answer answer = PlatformProvider(cardClass).instances();
    const Instance* card = findInstance(answer, "Tag", "usb0");
    ASSERT_NE(card, nullptr);
    EXPECT_EQ(textOf(*card, "Name"), "NIC1");
}

TEST(PlatformCards, HaveTypedNullsForWhatIsUnknown) {
    const DescribedHost host(description);
    const Answer answer = PlatformProvider(cardClass).instances();
    const Instance* card = findInstance(answer, "Tag", "usb0");
    ASSERT_NE(card, nullptr);
    const std::vector<NamedValue> expected{{"CreationClassName", text(cardClass)},
                                           {"Tag", text("usb0")},
                                           {"Name", text("NIC1")},
                                           {"Status", Value::null(CMPI_string)},
                                           {"ElementName", Value::null(CMPI_string)},
                                           {"Description", Value::null(CMPI_string)},
                                           {"SerialNumber", Value::null(CMPI_string)},
                                           {"PackageType", Value::null(CMPI_uint16)}};
    EXPECT_EQ(card->properties, expected);
}

TEST(PlatformPorts, HaveAllTheirProperties) {
    const DescribedHost host(description);
    const Answer answer = PlatformProvider(portClass).instances();
    ASSERT_EQ(answer.code, CMPI_RC_OK) << answer.message;
    ASSERT_EQ(answer.instances.size(), 3U);
    const std::vector<NamedValue> expected{{"SystemCreationClassName", text("TAVIS_ComputerSystem")},
                                           {"SystemName", text(hostName())},
                                           {"CreationClassName", text(portClass)},
                                           {"DeviceID", text("eth0")},
                                           {"Name", text("eth0")},
                                           {"Status", text("OK")},
                                           {"ElementName", text("first")},
                                           {"Caption", text("a port")},
                                           {"Description", text("the first port")},
                                           {"Speed", Value::uint(CMPI_uint64, 10000000000U)},
                                           {"MaxSpeed", Value::uint(CMPI_uint64, 25000000000U)},
                                           {"RequestedSpeed", Value::uint(CMPI_uint64, 10000000000U)},
                                           {"PortType", Value::uint(CMPI_uint16, 53)},
                                           {"PortNumber", Value::uint(CMPI_uint16, 0)},
                                           {"PermanentAddress", text("02005E000001")},
                                           {"FullDuplex", Value::boolean(true)},
                                           {"AutoSense", Value::boolean(false)},
                                           {"LinkTechnology", Value::uint(CMPI_uint16, 2)}};
    EXPECT_EQ(answer.instances[0].properties, expected);
}

TEST(PlatformPorts, OfTheManagementControllerBelongToItsSystem) {
    const DescribedHost host(description);
    const Answer answer = PlatformProvider(portClass).instances();
    ASSERT_NE(findInstance(answer, "DeviceID", "usb0"), nullptr);
    EXPECT_EQ(textOf(*findInstance(answer, "DeviceID", "usb0"), "SystemCreationClassName"), "TAVIS_SPComputerSystem");
    EXPECT_EQ(textOf(*findInstance(answer, "DeviceID", "br0"), "SystemCreationClassName"), "TAVIS_ComputerSystem");
}

TEST(PlatformPorts, HaveTypedNullsForWhatIsUnknown) {
    const DescribedHost host(description);
    const Answer answer = PlatformProvider(portClass).instances();
    const Instance* port = findInstance(answer, "DeviceID", "br0");
    ASSERT_NE(port, nullptr);
    ASSERT_EQ(port->properties.size(), 18U);
    const std::vector<std::pair<const char*, CMPIType>> unknown{
        {"Status", CMPI_string},           {"ElementName", CMPI_string}, {"Caption", CMPI_string},
        {"Description", CMPI_string},      {"Speed", CMPI_uint64},       {"MaxSpeed", CMPI_uint64},
        {"RequestedSpeed", CMPI_uint64},   {"PortType", CMPI_uint16},    {"PortNumber", CMPI_uint16},
        {"PermanentAddress", CMPI_string}, {"FullDuplex", CMPI_boolean}, {"AutoSense", CMPI_boolean},
        {"LinkTechnology", CMPI_uint16}};
    for (const auto& [name, type] : unknown) {
        const NamedValue* property = findName(port->properties, name);
        ASSERT_NE(property, nullptr) << name;
        EXPECT_EQ(property->value, Value::null(type)) << name;
    }
}

/** What holds for each of the classes. */
class PlatformClass : public testing::TestWithParam<const char*> {
  protected:
    DescribedHost host{description};
    PlatformProvider provider{GetParam()};
};

INSTANTIATE_TEST_SUITE_P(Classes, PlatformClass, testing::Values(cardClass, portClass),
                         [](const auto& tested) { return std::string(tested.param); });

TEST_P(PlatformClass, NamesAreThePathsOfTheInstances) {
    const Answer names = provider.names();
    const Answer instances = provider.instances();
    EXPECT_EQ(names.code, CMPI_RC_OK);
    EXPECT_TRUE(names.done);
    std::vector<ObjectPath> paths;
    for (const auto& instance : instances.instances) {
        paths.push_back(instance.path);
    }
    ASSERT_FALSE(paths.empty());
    EXPECT_EQ(names.paths, paths);
}

TEST_P(PlatformClass, PathsHaveTheRequestsNamespaceAndEveryKeyAsTheInstanceHasIt) {
    const std::size_t keys = GetParam() == std::string(cardClass) ? 2 : 4;
    for (const auto& instance : provider.instances().instances) {
        EXPECT_EQ(instance.path.nameSpace, "root/quarn");
        EXPECT_EQ(instance.path.className, GetParam());
        EXPECT_EQ(instance.path.host, "");
        ASSERT_EQ(instance.path.keys.size(), keys);
        for (const auto& key : instance.path.keys) {
            const NamedValue* property = findName(instance.properties, key.name);
            ASSERT_NE(property, nullptr) << key.name;
            EXPECT_EQ(property->value, key.value) << key.name;
        }
    }
}

TEST_P(PlatformClass, EveryInstanceIsFoundByItsName) {
    const Answer all = provider.instances();
    for (const auto& instance : all.instances) {
        const Answer one = provider.get(instance.path);
        ASSERT_EQ(one.code, CMPI_RC_OK) << one.message;
        EXPECT_TRUE(one.done);
        ASSERT_EQ(one.instances.size(), 1U);
        EXPECT_EQ(one.instances[0], instance);
    }
}

TEST_P(PlatformClass, UnknownKeyValuesAreNotFound) {
    const ObjectPath known = provider.names().paths.at(0);
    for (std::size_t i = 0; i < known.keys.size(); ++i) {
        ObjectPath unknown = known;
        unknown.keys[i].value = text("nothing");
        const Answer answer = provider.get(unknown);
        EXPECT_EQ(answer.code, CMPI_RC_ERR_NOT_FOUND) << known.keys[i].name;
        EXPECT_TRUE(answer.instances.empty());
        EXPECT_FALSE(answer.done);
    }
}

TEST_P(PlatformClass, AMissingOrWronglyTypedKeyIsNotFound) {
    const ObjectPath known = provider.names().paths.at(0);
    for (std::size_t i = 0; i < known.keys.size(); ++i) {
        ObjectPath missing = known;
        missing.keys.erase(missing.keys.begin() + static_cast<std::ptrdiff_t>(i));
        EXPECT_EQ(provider.get(missing).code, CMPI_RC_ERR_NOT_FOUND) << known.keys[i].name;
        ObjectPath number = known;
        number.keys[i].value = Value::uint(CMPI_uint64, 1);
        EXPECT_EQ(provider.get(number).code, CMPI_RC_ERR_NOT_FOUND) << known.keys[i].name;
    }
}

TEST_P(PlatformClass, KeysAreFoundByNameWhateverTheirOrderAndCase) {
    ObjectPath path = provider.names().paths.at(0);
    std::reverse(path.keys.begin(), path.keys.end());
    path.keys[0].name = "dEvIcEiD";
    if (GetParam() == std::string(cardClass)) {
        path.keys[0].name = "tAg";
    }
    EXPECT_EQ(provider.get(path).code, CMPI_RC_OK);
}

TEST_P(PlatformClass, APropertyListLeavesThoseAndTheKeys) {
    const ObjectPath path = provider.names().paths.at(0);
    std::vector<std::string> expected;
    for (const auto& key : path.keys) {
        expected.push_back(key.name);
    }
    const auto namesOf = [](const Answer& answer) {
        std::vector<std::string> names;
        for (const auto& property : answer.instances.at(0).properties) {
            names.push_back(property.name);
        }
        return names;
    };
    EXPECT_EQ(namesOf(provider.instances(Properties(std::vector<const char*>()))), expected);
    expected.insert(expected.end(), {"Name", "Description"});
    const Properties list = std::vector{"DESCRIPTION", "name", "name", "Nonsense"};
    EXPECT_EQ(namesOf(provider.instances(list)), expected);
    EXPECT_EQ(namesOf(provider.get(path, list)), expected);
}

TEST_P(PlatformClass, AWrongDescriptionIsReportedWithFileAndReason) {
    const DescribedHost wrong("[[port]]\nspeed = \"fast\"\n");
    const std::vector<Answer> answers{provider.names(), provider.instances(),
                                      provider.get({"", "root/quarn", "X", {}})};
    for (const auto& answer : answers) {
        EXPECT_EQ(answer.code, CMPI_RC_ERR_FAILED);
        EXPECT_NE(answer.message.find(wrong.file() + ":2: port.speed"), std::string::npos) << answer.message;
        EXPECT_TRUE(answer.paths.empty());
        EXPECT_TRUE(answer.instances.empty());
    }
}

TEST_P(PlatformClass, ADescriptionThatVanishedIsReported) {
    std::filesystem::remove(host.file());
    const Answer answer = provider.instances();
    EXPECT_EQ(answer.code, CMPI_RC_ERR_FAILED);
    EXPECT_NE(answer.message.find(host.file()), std::string::npos) << answer.message;
}

TEST_P(PlatformClass, EachRequestReadsAnew) {
    const std::size_t before = provider.names().paths.size();
    std::filesystem::resize_file(host.file(), 0);
    EXPECT_GT(before, 0U);
    EXPECT_TRUE(provider.names().paths.empty());
}

TEST_P(PlatformClass, IsAskedFromSeveralThreadsAtATime) {
    const Answer expected = provider.instances();
    std::atomic<int> good = 0;
    std::vector<std::thread> threads;
    for (int i = 0; i < 8; ++i) {
        threads.emplace_back([&] {
            for (int round = 0; round < 25; ++round) {
                good += provider.instances().instances == expected.instances ? 1 : 0;
            }
        });
    }
    for (auto& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(good, 8 * 25);
}

} // namespace
} // namespace marlo::test
