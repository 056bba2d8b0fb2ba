/**
 * @file
 * A described host, served: the real providers and those of the tests, behind the service, the gatekeeper and, where
 * a test wants it, the HTTP server.
 */
#pragma once

#include "host/http/Server.h"
#include "host/security/Gatekeeper.h"
#include "host/wbem/Service.h"
#include "tests/security/TemporaryDirectory.h"
#include "tests/wbem/Items.h"

#include <memory>
#include <mutex>
#include <string>
#include <vector>

namespace marlo::test {

/**
 * The agent of a process shows one host: there is one of these at a time. The users are accounts that every system
 * has, with roles of the test's own; the password of each is its name backwards.
 */
class Host {
  public:
    static constexpr const char* reader = "daemon";
    static constexpr const char* changer = "bin";
    static constexpr const char* subscriber = "sys";
    static constexpr const char* everything = "marlo"; ///< no account: the user that there is for trying things

    explicit Host(const wbem::Limits& limits = {}, std::vector<wbem::Route> routes = {});
    ~Host();
    Host(const Host&) = delete;
    Host& operator=(const Host&) = delete;

    [[nodiscard]] wbem::Service& service() { return *_service; }

    [[nodiscard]] Items& items() { return *_items; }

    [[nodiscard]] std::vector<wbem::Record> records() const;

    /** The value of the field Authorization of a user. */
    static std::string credentials(const std::string& user);

  private:
    TemporaryDirectory _directory;
    mutable std::mutex _mutex;
    std::vector<wbem::Record> _records;
    std::shared_ptr<Items> _items = std::make_shared<Items>();
    std::unique_ptr<ObjectManager> _manager;
    std::unique_ptr<security::Gatekeeper> _gatekeeper;
    std::unique_ptr<wbem::Service> _service;
};

} // namespace marlo::test
