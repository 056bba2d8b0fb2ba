/**
 * @file
 * A client's connection, kept alive from request to request.
 */
#pragma once

#include <string>

namespace marlo::test {

struct HttpAnswer {
    unsigned status = 0; ///< 0: the connection has ended
    std::string head;
    std::string body;
};

/** Over TCP to 127.0.0.1. What fails shows in the status of the answer. */
class Connection {
  public:
    /** `credentials` are "user:password". */
    Connection(unsigned short port, const std::string& credentials);
    ~Connection();
    Connection(const Connection&) = delete;
    Connection& operator=(const Connection&) = delete;

    [[nodiscard]] bool isOpen() const { return _fd >= 0; }

    /** Bytes as they are. */
    bool send(const std::string& bytes) const;

    /** Posts the body as a call of an intrinsic method, or of an extrinsic one of the path `object`. */
    HttpAnswer call(const std::string& method, const std::string& object, const std::string& body);

    /** The next answer, whole. */
    HttpAnswer receive();

    /** Goes away without a word, with a reset where `rudely`. */
    void leave(bool rudely);

  private:
    bool readMore();
    bool readUntil(std::size_t length);
    std::string readChunks();

    int _fd;
    std::string _authorization;
    std::string _buffer;
};

/** What `Content-Length` and the like say in a head; empty where there is none. */
std::string fieldOf(const std::string& head, const std::string& name);

} // namespace marlo::test
