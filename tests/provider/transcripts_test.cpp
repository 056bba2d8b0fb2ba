/**
 * What one call of each read operation writes to the log and to the trace, line by line: the transcripts beside this
 * file, in which every line number is N. A change of one of them is a change of the provider's behaviour.
 */
#include "tests/provider/ProviderCalls.h"
#include "tests/provider/Tree.h"

#include <fstream>
#include <sstream>

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

class Transcripts : public testing::TestWithParam<Transcript> {
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

    BrokerSetup setup;
};

TEST_P(Transcripts, AreWrittenToTheLetter) {
    run(GetParam());
    const std::string file = std::string(MARLO_TRANSCRIPTS) + "/" + nameOf(GetParam()) + ".txt";
    const std::string expected = contents(file);
    ASSERT_FALSE(expected.empty()) << file;
    EXPECT_EQ(written(), expected) << file;
}

INSTANTIATE_TEST_SUITE_P(EveryReadOperation, Transcripts, testing::ValuesIn(all()),
                         [](const auto& instance) { return nameOf(instance.param); });

} // namespace
