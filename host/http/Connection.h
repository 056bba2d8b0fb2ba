/**
 * @file
 * One client's connection, from its first byte to its last.
 */
#pragma once

#include "host/http/Fault.h"
#include "host/http/Reply.h"
#include "host/http/RequestParser.h"
#include "host/http/Site.h"

#include <any>
#include <memory>
#include <optional>
#include <string>

namespace marlo::http {

class Roster;

/**
 * Belongs to its loop, but while a job of it runs: then stream, parser and what has been read are the worker's, and
 * the loop looks at the state and the cut mark only.
 */
class Connection : public Job, public ReadinessListener, public std::enable_shared_from_this<Connection> {
  public:
    using Clock = std::chrono::steady_clock;

    Connection(Site& site, Loop& loop, Roster& roster, Descriptor descriptor, std::unique_ptr<Stream> stream,
               Peer peer, Seats::Seat seat);

    /** The rest in the hands of the loop. */
    void start();
    void onReady() override;
    /** Ends what takes too long. */
    void tick(Clock::time_point now);
    /** Ends the connection unless an answer is under way. */
    void endIfIdle();
    /** Ends the connection now. A job that runs finds its client gone. */
    void cut();

    void run() override;
    void done() override;

    [[nodiscard]] Loop& loop() const override { return _loop; }

  private:
    enum class State {
        handshake,
        idle,
        head,
        body,
        handling,
        postponed,
        delayed,
        sending,
        draining,
        lingering,
        closed
    };
    /** What a job left to be done. */
    enum class Outcome { answered, bodyWanted, postponed, faulty };

    void enter(State state, std::chrono::milliseconds time);
    void awaitInput();

    void shakeHands();
    /** Whether anything came; ends the connection when nothing will. */
    bool receive();
    void proceed();
    void readHead();
    void readBody();
    void drain();
    void submit();

    bool admit();
    std::optional<Answer> objection() const;
    bool mayPostpone();
    void sendRefusal(Answer&& refusal);
    void handle();
    void answerError(Reply& reply, const std::string& reason);
    void conclude(Reply& reply);
    [[nodiscard]] Terms terms(bool keepsAlive);
    [[nodiscard]] bool mayDrain() const;

    void refuse(unsigned status, const std::string& reason);
    void beginSending();
    void sendRest();
    void watchSending(Clock::time_point now);
    void answered();
    void nextRequest();
    void linger();
    void discard();
    void close();
    void reset();

    Site& _site;
    Loop& _loop;
    Roster& _roster;
    Readiness _readiness;
    std::unique_ptr<Stream> _stream;
    Peer _peer;
    std::optional<Seats::Seat> _seat;
    State _state = State::idle;
    Clock::time_point _deadline = Clock::time_point::max();
    std::atomic<bool> _isCut{false};

    RequestParser _parser;
    std::string _input; ///< what came and has not been used
    std::string _body;
    std::any _admission;
    bool _isAdmitted = false;
    Clock::time_point _lastAdmission = Clock::time_point::max(); ///< until then it may be put off; max: it was not
    std::uint64_t _id = 0;

    Outcome _outcome = Outcome::answered;
    std::optional<Fault> _fault;   ///< of a body
    std::string _output;           ///< what the client did not take at once
    std::size_t _sent = 0;         ///< of it, since
    std::optional<Uptake> _uptake; ///< of it
    Clock::time_point _watched;    ///< when that was last looked at
    std::chrono::milliseconds _delay{0};
    bool _keepsAlive = true;
    bool _mustReset = false;
    std::size_t _discarded = 0;
};

} // namespace marlo::http
