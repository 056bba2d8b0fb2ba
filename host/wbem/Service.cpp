#include "host/wbem/Service.h"

#include "host/wbem/CimFields.h"
#include "host/wbem/Content.h"
#include "host/wbem/Enumerations.h"
#include "host/wbem/HttpError.h"
#include "host/wbem/MethodCall.h"
#include "host/wbem/Operation.h"
#include "host/wbem/Reply.h"

#include <algorithm>
#include <utility>

namespace marlo::wbem {

namespace {

constexpr unsigned badRequest = 400;
constexpr unsigned forbidden = 403;
constexpr unsigned notImplemented = 501;

http::Answer textAnswer(unsigned status, const std::string& reason) {
    http::Answer answer;
    answer.status = status;
    answer.fields = {{"Content-Type", "text/plain; charset=utf-8"}};
    answer.body = reason + '\n';
    return answer;
}

/** The field CIMError has the prefix of the request's fields, where those have one. */
http::Answer refusal(const HttpError& error, const http::RequestHead& head) {
    http::Answer answer = textAnswer(error.status(), error.what());
    answer.fields.insert(answer.fields.end(), error.fields().begin(), error.fields().end());
    if (error.cimError().empty()) {
        return answer;
    }
    std::string prefix;
    try {
        prefix = readPrefix(head).value_or("");
    } catch (const HttpError&) { // then there is none
    }
    answer.fields.push_back({prefix + "CIMError", error.cimError()});
    return answer;
}

HttpError httpError(const cimxml::MessageError& error) {
    using Kind = cimxml::MessageError::Kind;
    switch (error.kind()) {
    case Kind::notWellFormed:
        return {badRequest, "request-not-well-formed", error.what()};
    case Kind::notValid:
        return {badRequest, "request-not-valid", error.what()};
    case Kind::notLooselyValid:
        return {badRequest, "request-not-loosely-valid", error.what()};
    case Kind::unsupportedOperation:
        return {badRequest, "unsupported-operation", error.what()};
    case Kind::unsupportedCimVersion:
        return {badRequest, "unsupported-cim-version", error.what()};
    case Kind::unsupportedDtdVersion:
        return {badRequest, "unsupported-dtd-version", error.what()};
    case Kind::unsupportedProtocolVersion:
        return {badRequest, "unsupported-protocol-version", error.what()};
    case Kind::multipleRequestsUnsupported:
        return {notImplemented, "multiple-requests-unsupported", error.what()};
    }
    return {badRequest, "request-not-valid", error.what()};
}

cimxml::Message readMessage(const std::string& body, const cimxml::Limits& limits) {
    try {
        return cimxml::readMessage(body, limits);
    } catch (const cimxml::MessageError& error) {
        throw httpError(error);
    }
}

/** What OPTIONS tells (DSP0200 and RFC 2774): the operations there are, by their groups, and the query languages. */
http::Answer optionsAnswer() {
    http::Answer answer;
    answer.fields = {
        {"Allow", "POST, M-POST, OPTIONS"},
        {"Opt", std::string(extensionUri) + "; ns=77"},
        {"77-CIMProtocolVersion", "1.0"},
        {"77-CIMSupportedFunctionalGroups",
         "basic-read, basic-write, instance-manipulation, association-traversal, query-execution"},
        {"77-CIMSupportedQueryLanguages", "WQL, CIM:CQL, DMTF:CQL"},
        {"77-CIMValidation", "loosely-validating"},
    };
    return answer;
}

bool takesTrailers(const http::RequestHead& head) {
    const auto values = head.values("TE");
    return std::any_of(values.begin(), values.end(),
                       [](std::string_view value) { return value.find("trailers") != std::string_view::npos; });
}

std::string_view pathOf(const http::RequestHead& head) {
    return std::string_view(head.target).substr(0, head.target.find('?'));
}

/** Notes what is called, on what; true for an intrinsic method. */
bool describe(const cimxml::Message& message, Record& record) {
    if (const auto* intrinsic = std::get_if<cimxml::IntrinsicCall>(&message.call)) {
        record.operation = intrinsic->method;
        record.nameSpace = intrinsic->nameSpace;
        record.className = subjectOf(*intrinsic);
        return true;
    }
    const auto& extrinsic = std::get<cimxml::ExtrinsicCall>(message.call);
    record.operation = extrinsic.method;
    record.nameSpace = extrinsic.path.nameSpace;
    record.className = extrinsic.path.className;
    return false;
}

} // namespace

struct Service::State {
    State(ObjectManager& objectManager, ServiceOptions&& given)
        : manager(objectManager), options(std::move(given)), enumerations(options.limits) {}

    void answer(const http::Request& request, http::Responder& responder, Record& record);
    [[nodiscard]] std::optional<http::Answer> plainAnswer(const http::Request& request,
                                                          const security::Identity& identity) const;
    void operate(const cimxml::Message& message, const security::Identity& identity, Reply& reply, Record& record);
    Status dispatch(const cimxml::Message& message, const security::Identity& identity, Reply& reply);
    Status callIntrinsic(const cimxml::IntrinsicCall& call, const security::Identity& identity, Reply& reply);
    Status callExtrinsic(const cimxml::ExtrinsicCall& call, const security::Identity& identity, Reply& reply);

    ObjectManager& manager;
    const ServiceOptions options;
    Enumerations enumerations;
};

Status Service::State::callIntrinsic(const cimxml::IntrinsicCall& call, const security::Identity& identity,
                                     Reply& reply) {
    const Operation* operation = findOperation(call.method);
    const std::string nameSpace = manager.spell(call.nameSpace);
    const security::Role role = operation == nullptr ? security::Role::read : operation->role();
    requireRole(identity, roleFor(role, manager.schema(), nameSpace, subjectOf(call)), call.method);
    if (operation == nullptr) {
        return {CMPI_RC_ERR_NOT_SUPPORTED, "there is no operation '" + call.method + "'", {}};
    }
    const Arguments arguments(call, operation->parameters(), manager.schema(), nameSpace);
    Call context{manager, enumerations, options.limits, identity, nameSpace, arguments, reply};
    return operation->run()(context);
}

Status Service::State::callExtrinsic(const cimxml::ExtrinsicCall& call, const security::Identity& identity,
                                     Reply& reply) {
    const std::string nameSpace = manager.spell(call.path.nameSpace);
    requireRole(identity, roleFor(security::Role::change, manager.schema(), nameSpace, call.path.className),
                call.method);
    return callMethod(manager, call, reply);
}

Status Service::State::dispatch(const cimxml::Message& message, const security::Identity& identity, Reply& reply) {
    const ActingFor acting(identity.name());
    if (const auto* intrinsic = std::get_if<cimxml::IntrinsicCall>(&message.call)) {
        return callIntrinsic(*intrinsic, identity, reply);
    }
    return callExtrinsic(std::get<cimxml::ExtrinsicCall>(message.call), identity, reply);
}

void Service::State::operate(const cimxml::Message& message, const security::Identity& identity, Reply& reply,
                             Record& record) {
    Status status;
    try {
        status = dispatch(message, identity, reply);
        if (status.ok()) {
            reply.succeed();
        }
    } catch (const http::ClientGone&) {
        throw;
    } catch (const RequestError& error) {
        status = {error.code(), error.what(), {}};
    } catch (const std::exception& error) {
        status = {CMPI_RC_ERR_FAILED, error.what(), {}};
    }
    record.cimStatus = static_cast<unsigned>(status.code);
    record.error = status.message;
    record.reported = std::move(status.reported);
    if (!status.ok()) {
        reply.fail(static_cast<unsigned>(status.code), status.message);
    }
}

std::optional<http::Answer> Service::State::plainAnswer(const http::Request& request,
                                                        const security::Identity& identity) const {
    const auto route = std::find_if(options.routes.begin(), options.routes.end(), [&request](const Route& candidate) {
        return candidate.method == request.head.method && candidate.path == pathOf(request.head);
    });
    if (route != options.routes.end()) {
        return identity.may(route->role) ? route->answer(request, identity)
                                         : textAnswer(forbidden, "user '" + identity.name() + "' may not see this");
    }
    return request.head.method == "OPTIONS" ? std::optional(optionsAnswer()) : std::nullopt;
}

void Service::State::answer(const http::Request& request, http::Responder& responder, Record& record) {
    const auto* admitted = std::any_cast<security::Identity>(&request.admission);
    const security::Identity identity = admitted == nullptr ? security::Identity() : *admitted;
    record.user = identity.name();
    if (auto plain = plainAnswer(request, identity)) {
        record.httpStatus = plain->status;
        record.bytesOut = plain->body.size();
        responder.send(*std::move(plain));
        return;
    }
    const CimFields fields = [&request] {
        auto prefix = readPrefix(request.head);
        std::string type = checkContent(request.head);
        CimFields read = readCimFields(request.head, std::move(prefix));
        read.answerType = std::move(type);
        return read;
    }();
    const cimxml::Message message = readMessage(request.body, options.limits.xml);
    compareWithBody(fields, message);
    const bool isIntrinsic = describe(message, record);
    Reply reply(responder, {message.id, record.operation, isIntrinsic, options.host, fields.answerType, fields.prefix,
                            takesTrailers(request.head)});
    operate(message, identity, reply, record);
    record.httpStatus = 200;
    record.bytesOut = reply.bytes();
}

Service::Service(ObjectManager& manager, ServiceOptions options)
    : _state(std::make_unique<State>(manager, std::move(options))) {}

Service::~Service() = default;

std::optional<http::Answer> Service::admit(const http::RequestHead& head, const http::Peer& peer,
                                           std::any& admission) {
    security::Admission admitted = _state->options.admit(head, peer);
    if (!admitted.refusal) {
        admission = std::move(admitted.identity);
    }
    return std::move(admitted.refusal);
}

void Service::handle(http::Request&& request, http::Responder& responder) {
    const auto begin = std::chrono::steady_clock::now();
    Record record;
    record.id = request.id;
    record.peer = request.peer.toString();
    record.operation = request.head.method + " " + std::string(pathOf(request.head));
    record.bytesIn = request.body.size();
    try {
        _state->answer(request, responder, record);
    } catch (const HttpError& error) {
        http::Answer answer = refusal(error, request.head);
        record.httpStatus = answer.status;
        record.error = error.what();
        record.bytesOut = answer.body.size();
        responder.send(std::move(answer));
    } catch (const http::ClientGone& gone) {
        record.error = gone.what();
    }
    record.time = std::chrono::duration_cast<std::chrono::microseconds>(std::chrono::steady_clock::now() - begin);
    if (_state->options.log) {
        _state->options.log(record);
    }
}

http::Answer Service::refuse(unsigned status, const std::string& reason) {
    return textAnswer(status, reason);
}

std::size_t Service::openEnumerations() const {
    return _state->enumerations.size();
}

} // namespace marlo::wbem
