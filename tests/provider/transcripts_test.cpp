/**
 * What one call of each operation writes to the log and to the trace, line by line: the transcripts beside this
 * file, in which every line number is N. A change of one of them is a change of the provider's behaviour.
 */
#include "tests/provider/ProviderCalls.h"
#include "tests/provider/Tree.h"

#include <fstream>
#include <functional>
#include <sstream>
#include <stdexcept>

#include <gtest/gtest.h>

namespace {

using namespace provider_test;
using marlo::ObjectPath;

enum class Operation { getInstance, enumInstanceNames, enumInstances };

struct Transcript {
    Subject subject;
    Operation operation;
    std::string variant; ///< empty for a call that is answered
};

std::string nameOf(Operation operation) {
    return operation == Operation::getInstance         ? "GetInstance"
           : operation == Operation::enumInstanceNames ? "EnumInstanceNames"
                                                       : "EnumInstances";
}

std::string nameOf(const Transcript& transcript) {
    return transcript.subject.prefix + "_" + nameOf(transcript.operation) + transcript.variant;
}

std::ostream& operator<<(std::ostream& stream, const Transcript& transcript) {
    return stream << nameOf(transcript);
}

std::vector<Transcript> all() {
    std::vector<Transcript> list;
    for (const Subject& subject : allProviders()) {
        for (const Operation operation :
             {Operation::getInstance, Operation::enumInstanceNames, Operation::enumInstances}) {
            list.push_back({subject, operation, ""});
            list.push_back({subject, operation, "_wrongClass"});
        }
        list.push_back({subject, Operation::getInstance, "_keyless"});
    }
    return list;
}

std::string contents(const std::string& file) {
    std::ifstream stream(file);
    std::ostringstream text;
    text << stream.rdbuf();
    return text.str();
}

class Transcripts : public testing::Test {
  protected:
    Transcripts() {
        scripted_agent::reset();
        addFullAdapter("usb0", "BMC");
        addFullAdapter("eth0");
        setup.platform.cards = {card("NIC1"), card("eth0")};
        setup.platform.ports = {port("9", "TAVIS_SPComputerSystem"), port("0")};
    }

    /** The class asked for, with keys for GetInstance. */
    static ObjectPath reference(const Transcript& transcript) {
        const bool wrong = transcript.variant == "_wrongClass";
        ObjectPath path = classPath(wrong ? "MARLO_SomethingElse" : transcript.subject.className);
        if (transcript.operation == Operation::getInstance && transcript.variant != "_keyless") {
            const bool configuration = transcript.subject.className == CONFIGURATION;
            path.keys.push_back({configuration ? "SettingID" : "Other", marlo::Value::string("eth0")});
        }
        return path;
    }

    void run(const Transcript& transcript) {
        ProviderCalls calls(setup);
        const ObjectPath path = reference(transcript);
        switch (transcript.operation) {
        case Operation::getInstance:
            calls.getInstance(transcript.subject, path);
            break;
        case Operation::enumInstanceNames:
            calls.enumInstanceNames(transcript.subject, path);
            break;
        case Operation::enumInstances:
            calls.enumInstances(transcript.subject, path);
            break;
        }
    }

    static std::string written() {
        std::string text;
        for (const std::string& line : normalised(scripted_agent::record())) {
            if (line.starts_with("log ") || line.starts_with("trace ")) {
                text += line + '\n';
            }
        }
        return text;
    }

    static void expectTranscript(const std::string& name) {
        const std::string file = std::string(MARLO_TRANSCRIPTS) + "/" + name + ".txt";
        const std::string expected = contents(file);
        ASSERT_FALSE(expected.empty()) << file;
        EXPECT_EQ(written(), expected) << file;
    }

    BrokerSetup setup;
};

class ReadTranscripts : public Transcripts, public testing::WithParamInterface<Transcript> {};

TEST_P(ReadTranscripts, AreWrittenToTheLetter) {
    run(GetParam());
    expectTranscript(nameOf(GetParam()));
}

/** A method or a modification, told by what it is given. */
struct WriteTranscript {
    std::string name; ///< of the file
    std::function<void(ProviderCalls&)> run;
    std::function<void()> prepare = [] {};

    friend std::ostream& operator<<(std::ostream& stream, const WriteTranscript& transcript) {
        return stream << transcript.name;
    }
};

ObjectPath adapter(const std::string& settingId) {
    return instancePath(CONFIGURATION, {{"SettingID", settingId}});
}

WriteTranscript method(const std::string& name, const std::vector<marlo::NamedValue>& arguments,
                       const std::string& settingId = "eth0") {
    return {"NetworkAdapter_InvokeMethod_" + name,
            [=](ProviderCalls& calls) { calls.invokeMethod(adapter(settingId), name, arguments); }};
}

/** The same call with another file and after a preparation. */
WriteTranscript variantOf(
    WriteTranscript transcript, const std::string& variant, std::function<void()> prepare = [] {}) {
    transcript.name += "_" + variant;
    transcript.prepare = std::move(prepare);
    return transcript;
}

void refuseToWrite() {
    scripted_agent::failAt("setProperty", 1, [] { throw std::runtime_error("refused"); });
}

void removeAdapters() {
    scripted_agent::script().nodes.clear();
}

WriteTranscript modification() {
    marlo::Instance instance;
    instance.path = adapter("eth0");
    instance.properties = {{"IPv4Address", strings({"192.0.2.20", "192.0.2.21"})},
                           {"SubnetMask", strings({"255.255.255.128"})},
                           {"DefaultIPGateway", strings({"192.0.2.2"})},
                           {"DNSDomain", marlo::Value::string("example.net")}};
    return {"NetworkAdapter_ModifyInstance",
            [instance](ProviderCalls& calls) { calls.modifyInstance(instance.path, instance); }};
}

WriteTranscript modificationOf(const std::string& variant, const std::string& settingId,
                               const std::vector<marlo::NamedValue>& properties) {
    return {"NetworkAdapter_ModifyInstance_" + variant, [=](ProviderCalls& calls) {
                marlo::Instance instance;
                instance.path = settingId.empty() ? classPath(CONFIGURATION) : adapter(settingId);
                instance.properties = properties;
                calls.modifyInstance(instance.path, instance);
            }};
}

std::vector<WriteTranscript> allWrites() {
    using marlo::Value;
    const WriteTranscript dhcp = method("EnableDHCP", {});
    const WriteTranscript fixed = method(
        "EnableStatic", {{"IPAddress", strings({"192.0.2.20"})}, {"SubnetMask", strings({"255.255.255.128"})}});
    const WriteTranscript gateway = method("SetGateways", {{"DefaultIPGateway", strings({"192.0.2.2"})}});
    const WriteTranscript domain = method("SetDNSDomain", {{"DNSDomain", Value::string("example.net")}});
    const WriteTranscript servers =
        method("SetDNSServerSearchOrder", {{"DNSServerSearchOrder", strings({"192.0.2.54", "192.0.2.55"})}});
    const WriteTranscript suffixes =
        method("SetDNSSuffixSearchOrder", {{"DNSDomainSuffixSearchOrder", strings({"example.net"})}});
    return {
        dhcp,
        variantOf(dhcp, "noAdapters", removeAdapters),
        variantOf(dhcp, "refused", refuseToWrite),
        variantOf(method("EnableDHCP", {}, "eth9"), "unknown"),
        fixed,
        variantOf(fixed, "refused", refuseToWrite),
        variantOf(method("EnableStatic", {}), "noArguments"),
        variantOf(method("EnableStatic", {}, "eth9"), "unknown"),
        gateway,
        variantOf(gateway, "refused", refuseToWrite),
        variantOf(method("SetGateways", {}), "noArguments"),
        domain,
        variantOf(domain, "refused", refuseToWrite),
        variantOf(method("SetDNSDomain", {{"DNSDomain", Value::string("example.net")}}, "eth9"), "unknown"),
        variantOf(method("SetDNSDomain", {}), "noArguments"),
        variantOf(domain, "noAdapters", removeAdapters),
        servers,
        variantOf(servers, "refused", refuseToWrite),
        suffixes,
        variantOf(method("Unheard", {}), "unknownMethod"),
        modification(),
        variantOf(modification(), "noAdapters", removeAdapters),
        variantOf(modification(), "refused", refuseToWrite),
        modificationOf("empty", "eth0", {}),
        modificationOf("unknown", "eth9", {{"DNSDomain", Value::string("example.net")}}),
        modificationOf("keyless", "", {}),
    };
}

class WriteTranscripts : public Transcripts, public testing::WithParamInterface<WriteTranscript> {};

TEST_P(WriteTranscripts, AreWrittenToTheLetter) {
    const WriteTranscript& transcript = GetParam();
    transcript.prepare();
    ProviderCalls calls(setup);
    transcript.run(calls);
    expectTranscript(transcript.name);
}

INSTANTIATE_TEST_SUITE_P(EveryWriteOperation, WriteTranscripts, testing::ValuesIn(allWrites()),
                         [](const auto& instance) { return instance.param.name; });

INSTANTIATE_TEST_SUITE_P(EveryReadOperation, ReadTranscripts, testing::ValuesIn(all()),
                         [](const auto& instance) { return nameOf(instance.param); });

} // namespace
