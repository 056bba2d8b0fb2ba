#include "host/http/Loop.h"

#include <boost/asio/executor_work_guard.hpp>
#include <boost/asio/io_context.hpp>
#include <boost/asio/posix/stream_descriptor.hpp>
#include <boost/asio/post.hpp>
#include <boost/asio/steady_timer.hpp>
#include <cstddef>
#include <utility>

namespace marlo::http {
namespace {

namespace asio = boost::asio;
using asio::posix::stream_descriptor;
using boost::system::error_code;

} // namespace

struct Loop::Asio {
    asio::io_context context{1}; // one thread at a time: nobody needs to be woken up for what is left to do
    asio::executor_work_guard<asio::io_context::executor_type> guard{context.get_executor()};
};

Loop::Loop() : _asio(std::make_unique<Asio>()), _scratch(std::make_unique_for_overwrite<char[]>(scratchSize)) {}

Loop::~Loop() = default;

bool Loop::runOne() {
    return _asio->context.run_one() != 0;
}

void Loop::post(std::function<void()> what) {
    asio::post(_asio->context, std::move(what));
}

void Loop::end() {
    _asio->context.stop();
}

struct Timer::Asio {
    asio::steady_timer timer;
};

Timer::Timer(Loop& loop) : _asio(new Asio{asio::steady_timer(loop._asio->context)}) {}

Timer::~Timer() = default;

void Timer::after(std::chrono::milliseconds delay, std::function<void()> what) {
    _asio->timer.expires_after(delay);
    _asio->timer.async_wait([what = std::move(what)](const error_code& error) {
        if (!error) {
            what();
        }
    });
}

struct Readiness::Asio {
    stream_descriptor descriptor;

    void await(stream_descriptor::wait_type kind, std::shared_ptr<ReadinessListener>&& listener) {
        descriptor.async_wait(kind, [listener = std::move(listener)](const error_code& error) {
            if (error != asio::error::operation_aborted) {
                listener->onReady();
            }
        });
    }
};

Readiness::Readiness(Loop& loop, Descriptor descriptor)
    : _asio(new Asio{stream_descriptor(loop._asio->context, descriptor.get())}) {
    static_cast<void>(descriptor.release());
}

Readiness::~Readiness() = default;

int Readiness::descriptor() const {
    return _asio->descriptor.is_open() ? const_cast<stream_descriptor&>(_asio->descriptor).native_handle() : -1;
}

void Readiness::awaitReadable(std::shared_ptr<ReadinessListener> listener) {
    _asio->await(stream_descriptor::wait_read, std::move(listener));
}

void Readiness::awaitWritable(std::shared_ptr<ReadinessListener> listener) {
    _asio->await(stream_descriptor::wait_write, std::move(listener));
}

void Readiness::close() {
    error_code ignored;
    _asio->descriptor.close(ignored);
}

} // namespace marlo::http
