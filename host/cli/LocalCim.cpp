#include "host/cli/LocalCim.h"

#include "host/cimom/ObjectManager.h"
#include "host/cimxml/Answer.h"
#include "host/cimxml/Writer.h"
#include "host/cli/Text.h"
#include "host/server/LocalClient.h"

#include <chrono>
#include <functional>

namespace marlo::cli {

namespace {

constexpr const char* interop = "root/interop";
constexpr std::chrono::seconds Patience(60);
constexpr unsigned HttpOk = 200;

/** A request with one parameter, whose content `write` adds. */
std::string makeRequest(const std::string& method, const std::string& parameter,
                        const std::function<void(cimxml::Writer&)>& write) {
    std::string document = R"(<?xml version="1.0" encoding="utf-8"?><CIM CIMVERSION="2.0" DTDVERSION="2.0"><MESSAGE )"
                           R"(ID="1" PROTOCOLVERSION="1.0"><SIMPLEREQ><IMETHODCALL NAME=")" +
                           method +
                           R"("><LOCALNAMESPACEPATH><NAMESPACE NAME="root"/><NAMESPACE NAME="interop"/>)"
                           R"(</LOCALNAMESPACEPATH><IPARAMVALUE NAME=")" +
                           parameter + R"(">)";
    cimxml::Writer writer([&document](std::string_view piece) { document += piece; }, "");
    write(writer);
    writer.finish();
    return document + "</IPARAMVALUE></IMETHODCALL></SIMPLEREQ></MESSAGE></CIM>";
}

/** As many as the server ever has of one class. */
cimxml::Limits answerLimits() {
    cimxml::Limits limits;
    limits.elements = 10'000'000;
    return limits;
}

cimxml::IntrinsicAnswer operate(const std::string& socket, const std::string& method, const std::string& document) {
    const server::LocalAnswer answer = server::operateLocally(socket, method, interop, document, Patience);
    if (answer.status != HttpOk) {
        throw std::runtime_error(socket + ": the server answers " + std::to_string(answer.status) + ": " +
                                 makePrintable(answer.body));
    }
    cimxml::IntrinsicAnswer read = cimxml::readIntrinsicAnswer(answer.body, answerLimits());
    if (read.code != 0) {
        const auto code = static_cast<CMPIrc>(read.code);
        throw Refused(code,
                      statusName(code) + " (" + std::to_string(read.code) + "): " + makePrintable(read.description));
    }
    return read;
}

ObjectPath located(ObjectPath path) {
    path.host.clear();
    path.nameSpace = interop;
    return path;
}

} // namespace

std::vector<Instance> LocalCim::enumerate(const std::string& className) const {
    const std::string method = "EnumerateInstances";
    cimxml::IntrinsicAnswer answer = operate(
        _socket, method,
        makeRequest(method, "ClassName", [&className](cimxml::Writer& writer) { writer.className(className); }));
    for (Instance& each : answer.instances) {
        each.path = located(std::move(each.path));
        for (NamedValue& property : each.properties) {
            if (const auto* path = std::get_if<std::shared_ptr<const ObjectPath>>(&property.value.data)) {
                property.value.data = std::make_shared<const ObjectPath>(located(**path));
            }
        }
    }
    return std::move(answer.instances);
}

ObjectPath LocalCim::create(const Instance& instance) const {
    const std::string method = "CreateInstance";
    const auto write = [&instance](cimxml::Writer& writer) {
        writer.instance(instance, cimxml::Wrap::instance, nullptr, {});
    };
    cimxml::IntrinsicAnswer answer = operate(_socket, method, makeRequest(method, "NewInstance", write));
    if (answer.paths.size() != 1) {
        throw std::runtime_error(_socket + ": the server made an instance and does not say which");
    }
    return located(std::move(answer.paths.front()));
}

void LocalCim::remove(const ObjectPath& path) const {
    const std::string method = "DeleteInstance";
    const auto write = [&path](cimxml::Writer& writer) { writer.path(path, cimxml::PathWrap::name); };
    static_cast<void>(operate(_socket, method, makeRequest(method, "InstanceName", write)));
}

} // namespace marlo::cli
