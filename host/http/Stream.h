/**
 * @file
 * The bytes of a connection, in the clear or through TLS. Nothing here waits.
 */
#pragma once

#include <cstddef>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

namespace marlo::http {

class TlsContext;

/** What came of an attempt to go on. */
enum class Progress {
    done,      ///< some bytes went through, or the handshake is complete
    wantRead,  ///< nothing goes on before the descriptor is readable
    wantWrite, ///< nothing goes on before it is writable
    ended,     ///< the other end has sent all it will send
    failed,    ///< the connection is of no use any more
};

struct Transfer {
    Progress progress = Progress::failed;
    std::size_t bytes = 0;
};

/** On a descriptor that does not block and that belongs to somebody else. One thread at a time. Never raises SIGPIPE.
 */
class Stream {
  public:
    virtual ~Stream() = default;

    /** To be repeated until it is done, before anything else. */
    virtual Progress handshake() = 0;
    virtual Transfer read(char* into, std::size_t size) = 0;
    /** May take only a part. */
    virtual Transfer write(std::string_view bytes) = 0;
    /** There are bytes to read though the descriptor may not be readable. */
    [[nodiscard]] virtual bool hasPending() const = 0;
    /** Tells the other end that nothing more will be sent. */
    virtual void finish() = 0;
    /** The common name of the other end's certificate, where it showed one and it was good. */
    [[nodiscard]] virtual std::optional<std::string> commonName() const = 0;
    /** Why the handshake failed; empty where there is nothing to say. */
    [[nodiscard]] virtual std::string problem() const = 0;

  protected:
    Stream() = default;
    Stream(const Stream&) = default;
    Stream& operator=(const Stream&) = default;
};

std::unique_ptr<Stream> makePlainStream(int descriptor);

/** The server's side. `context` is kept for as long as the stream lives. */
std::unique_ptr<Stream> makeTlsStream(int descriptor, std::shared_ptr<const TlsContext> context);

} // namespace marlo::http
