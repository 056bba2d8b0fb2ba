/**
 * @file
 * Sockets that connections come in by.
 */
#pragma once

#include "host/http/Site.h"

#include <functional>
#include <memory>

#include <sys/types.h>

namespace marlo::http {

/** In the hands of its loop from `start` on. */
class Listener : public ReadinessListener, public std::enable_shared_from_this<Listener> {
  public:
    /** Takes a connection that does not block, and who is at its other end. */
    using Adopt = std::function<void(Descriptor&&, Peer&&)>;

    /**
     * Binds, or throws std::runtime_error that names the endpoint and the reason. A Unix domain socket that was left
     * behind is replaced; one on which somebody answers is not.
     */
    Listener(Site& site, Loop& loop, const Endpoint& endpoint, Adopt adopt);
    ~Listener() override;
    Listener(const Listener&) = delete;
    Listener& operator=(const Listener&) = delete;

    /** With the port that was found. */
    [[nodiscard]] const Endpoint& endpoint() const { return _endpoint; }

    void start();
    void onReady() override;
    /** Takes nothing more, and removes the Unix domain socket where it is still its own. */
    void close();

  private:
    /** Whether another one may be waiting. */
    bool acceptOne();
    void pause(int error);
    void removeSocketFile();

    Site& _site;
    Endpoint _endpoint;
    Adopt _adopt;
    dev_t _device = 0; ///< of the Unix domain socket's file
    ino_t _inode = 0;
    Readiness _readiness;
    Timer _timer;
    bool _isPaused = false;
};

} // namespace marlo::http
