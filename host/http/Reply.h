/**
 * @file
 * One answer on its way to one client.
 */
#pragma once

#include "host/http/HeadText.h"
#include "host/http/Server.h"
#include "host/http/Stream.h"
#include "host/http/Uptake.h"

#include <atomic>
#include <chrono>
#include <functional>
#include <optional>
#include <string>

namespace marlo::http {

/** What the request and the server say about how its answer may look. */
struct Terms {
    unsigned version = 11;
    bool isHead = false; ///< the method: an answer has no body
    bool keepsAlive = true;
    bool takesTrailers = false;
    std::size_t gathered = 0;
    std::chrono::milliseconds sendTime{0};
    std::size_t sendRate = 1;
    std::chrono::milliseconds holdTime{0};
    std::chrono::milliseconds longestHold{0};
    /** Asked when the client has been waited for as long as holdTime; false: it may be for longestHold. */
    std::function<bool()> stepAside;
};

/**
 * What an answer ends with is left behind for the connection to send where the client does not take it at once: only
 * answers that are being written hold a worker up.
 */
class Reply : public Responder {
  public:
    /** `isCut` becomes true, and the descriptor is shut down, when nothing is to be waited for any more. */
    Reply(Stream& stream, int descriptor, const std::atomic<bool>& isCut, Terms terms);

    void send(Answer&& answer) override;
    void begin(unsigned status, Fields&& fields) override;
    void write(std::string_view piece) override;
    void finish() override;
    void fail(Answer&& instead, Fields&& trailers) override;

    [[nodiscard]] bool hasBegun() const { return _stage != Stage::fresh; }

    [[nodiscard]] bool isComplete() const { return _stage == Stage::complete; }

    /** The client would take what it has for a whole answer, or is gone: the connection is to be reset. */
    [[nodiscard]] bool isBroken() const { return _isBroken; }

    /** The client could have had the answer, but took it too slowly. */
    [[nodiscard]] bool wasTooSlow() const { return _wasTooSlow; }

    [[nodiscard]] bool keepsAlive() const { return _terms.keepsAlive; }

    [[nodiscard]] std::chrono::milliseconds delay() const { return _delay; }

    /** What is still to be sent. */
    std::string takeRest() { return std::move(_rest); }

  private:
    enum class Stage { fresh, gathering, streaming, complete };

    void sendWhole(unsigned status, const Fields& fields, std::string_view body);
    void sendPiece();
    void sendNow(std::string_view bytes);
    void sendLast();
    void await(Progress progress);
    void hold(Pace::Time time);
    [[noreturn]] void drop(const char* why);
    [[noreturn]] void giveUp(const char* why);
    void require(bool isInOrder) const;

    Stream& _stream;
    int _descriptor;
    const std::atomic<bool>& _isCut;
    Terms _terms;
    std::optional<Uptake> _uptake; ///< of what is written
    Pace::Time _held{0};           ///< the time that the worker has waited
    bool _isAside = false;
    Stage _stage = Stage::fresh;
    unsigned _status = 0;
    Fields _fields;
    std::string _gathered;
    std::string _rest;
    std::chrono::milliseconds _delay{0};
    bool _isBroken = false;
    bool _wasTooSlow = false;
};

} // namespace marlo::http
