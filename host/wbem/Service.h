/**
 * @file
 * CIM operations over HTTP (DSP0200): what stands between the HTTP server and the object manager.
 */
#pragma once

#include "host/cimom/ObjectManager.h"
#include "host/http/Server.h"
#include "host/security/Gatekeeper.h"
#include "host/wbem/Limits.h"

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace marlo::wbem {

/** What became of one request, for the log. */
struct Record {
    std::uint64_t id = 0; ///< http::Request::id
    std::string peer;
    std::string user;
    std::string operation; ///< the CIM method, else the HTTP method and path
    std::string nameSpace;
    std::string className;
    std::optional<unsigned> cimStatus; ///< none where the request did not come as far as that
    std::string error;                 ///< why the request was refused or failed
    std::vector<std::string> reported; ///< what the agent logged while the operation was under way
    unsigned httpStatus = 0;           ///< 0: the client went away before it had its answer
    std::chrono::microseconds time{0};
    std::size_t bytesIn = 0;  ///< of the request's body
    std::size_t bytesOut = 0; ///< of the answer's body, as far as it was handed over
};

/** A path of its own beside the operations, such as one that tells how the server is. */
struct Route {
    std::string method; ///< neither POST nor M-POST: those are operations, on any path
    std::string path;   ///< "/status"; what follows a question mark does not count
    security::Role role = security::Role::read;
    std::function<http::Answer(const http::Request& request, const security::Identity& identity)> answer;
};

struct ServiceOptions {
    /** Says who asks: Gatekeeper::admit. Sees every request, whatever its method and path, before anything else. */
    std::function<security::Admission(const http::RequestHead& head, const http::Peer& peer)> admit;
    std::string host; ///< this system's name, in paths that carry one
    Limits limits;
    std::vector<Route> routes;
    std::function<void(const Record& record)> log; ///< any thread, after each request that was admitted
};

/**
 * Answers POST and M-POST on any path with CIM, OPTIONS with what it can do, and its routes. Everything else is 405.
 * Answers of many objects are written while they come about, so that memory does not grow with them. What an
 * operation throws is CIM_ERR_FAILED with its text.
 */
class Service final : public http::Handler {
  public:
    /** `manager` outlives this. */
    Service(ObjectManager& manager, ServiceOptions options);
    ~Service() override;
    Service(const Service&) = delete;
    Service& operator=(const Service&) = delete;

    std::optional<http::Answer> admit(const http::RequestHead& head, const http::Peer& peer,
                                      std::any& admission) override;
    void handle(http::Request&& request, http::Responder& responder) override;
    http::Answer refuse(unsigned status, const std::string& reason) override;

    /** Enumerations that clients may pull from. */
    [[nodiscard]] std::size_t openEnumerations() const;

  private:
    struct State;
    std::unique_ptr<State> _state;
};

} // namespace marlo::wbem
