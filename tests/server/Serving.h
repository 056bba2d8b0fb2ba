/**
 * @file
 * A server with a provider that takes its time, throws and cannot be loaded.
 */
#pragma once

#include "tests/server/Connection.h"
#include "tests/server/Served.h"

#include <chrono>
#include <filesystem>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

namespace marlo::test {

inline std::string readFile(const std::string& file) {
    std::ifstream stream(file);
    return {std::istreambuf_iterator<char>(stream), {}};
}

inline constexpr const char* Adapters = "MARLO_NetworkAdapterConfiguration";

/** A call of SERVED_Thing.Sleep. */
inline std::string sleepBody(unsigned time) {
    return R"(<?xml version="1.0" encoding="utf-8"?><CIM CIMVERSION="2.0" DTDVERSION="2.0"><MESSAGE ID="9" )"
           R"(PROTOCOLVERSION="1.0"><SIMPLEREQ><METHODCALL NAME="Sleep"><LOCALINSTANCEPATH><LOCALNAMESPACEPATH>)"
           R"(<NAMESPACE NAME="root"/><NAMESPACE NAME="served"/></LOCALNAMESPACEPATH><INSTANCENAME )"
           R"(CLASSNAME="SERVED_Thing"><KEYBINDING NAME="Id"><KEYVALUE VALUETYPE="string">one</KEYVALUE>)"
           R"(</KEYBINDING></INSTANCENAME></LOCALINSTANCEPATH><PARAMVALUE NAME="Milliseconds" PARAMTYPE="uint32">)"
           "<VALUE>" +
           std::to_string(time) + "</VALUE></PARAMVALUE></METHODCALL></SIMPLEREQ></MESSAGE></CIM>";
}

inline constexpr const char* SleepObject = "root/served:SERVED_Thing.Id=\"one\"";

class Serving : public ServedTest {
  protected:
    Serving() {
        serveSite();
        setVariable("SERVED_THINGS", path("things"));
    }

    [[nodiscard]] std::string credentials() const { return "marlo:" + password(); }

    /** Waits until the provider has noted a word. */
    void awaitNote(const std::string& word) const {
        const auto end = std::chrono::steady_clock::now() + Patience;
        while (readFile(path("things")).find(word) == std::string::npos) {
            ASSERT_LT(std::chrono::steady_clock::now(), end) << "the provider never noted: " << word;
            std::this_thread::sleep_for(std::chrono::milliseconds(5));
        }
    }

    HttpAnswer enumerate(Connection& connection) const {
        return connection.call("EnumerateInstances", "root/tavis",
                               intrinsic("EnumerateInstances", "root/tavis", classParameter(Adapters)));
    }

    /** curl with credentials and what a call of EnumerateInstances carries. */
    [[nodiscard]] Outcome post(const std::vector<std::string>& more) const {
        write("body", intrinsic("EnumerateInstances", "root/tavis", classParameter(Adapters)));
        std::vector<std::string> arguments{"-u",
                                           credentials(),
                                           "--data-binary",
                                           "@body",
                                           "-H",
                                           "Content-Type: application/xml",
                                           "-H",
                                           "CIMOperation: MethodCall",
                                           "-H",
                                           "CIMMethod: EnumerateInstances",
                                           "-H",
                                           "CIMObject: root%2Ftavis"};
        arguments.insert(arguments.end(), more.begin(), more.end());
        return curl(arguments);
    }

    [[nodiscard]] std::string address(const std::string& rest = "cimom") const {
        return "http://127.0.0.1:" + std::to_string(port("http")) + "/" + rest;
    }

    [[nodiscard]] Outcome status(std::vector<std::string> more = {}) const {
        more.insert(more.begin(), {MARLO_EXECUTABLE, "status", "--socket", socket()});
        return runProgram(more, {"LC_ALL=C"}, "", directory());
    }
};

} // namespace marlo::test
