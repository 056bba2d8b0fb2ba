/**
 * @file
 * A network namespace of the test's own: a kernel to play with that nobody else sees.
 */
#pragma once

#include "tests/support/Require.h"

#include <filesystem>
#include <functional>
#include <string>

namespace Orv::Test {

/** Why this process cannot make namespaces (mostly: it is not root), as one sentence; empty when it can. */
std::string whyNoNamespaces();

/**
 * A network namespace with a mount namespace beside it, alive as long as the object. It starts with the loopback
 * interface alone, down, as a new namespace does; its /sys shows its own interfaces. What it mounts and creates never
 * shows outside.
 *
 * The test's own threads stay where they are: `run` and the commands go inside on a thread made for the call. Every
 * operation may be called from any thread, and from several at a time. Failures are thrown as std::runtime_error or
 * std::system_error.
 */
class Namespace {
  public:
    Namespace();
    ~Namespace();
    Namespace(const Namespace&) = delete;
    Namespace& operator=(const Namespace&) = delete;

    /** Runs `work` inside, waits for it and passes on what it throws. A socket made there stays in the namespace. */
    void run(const std::function<void()>& work) const;

    /** Runs a shell command inside and returns its standard output; throws with its output when it fails. */
    std::string shell(const std::string& command) const;

    /** Runs `ip ARGUMENTS` inside, as shell() does. */
    std::string ip(const std::string& arguments) const;

    /** Runs `ip -batch` inside over the lines: thousands of changes in one process. */
    void ipBatch(const std::string& lines) const;

    /** Puts a file with this content in place of an existing one, inside only. Again to change it. */
    void replaceFile(const std::string& path, const std::string& content);

    /** Moves the calling thread inside for good; for a child that was forked for that. */
    void enter() const;

    /** A descriptor of the network namespace, for setns and for `ip link set ... netns`; stays owned by the object.
     */
    [[nodiscard]] int descriptor() const { return _network; }

    /** The network namespace as a path that `ip link set DEVICE netns PATH` of this process's children takes. */
    [[nodiscard]] std::string descriptorPath() const;

  private:
    int _network = -1;
    int _mounts = -1;
    int _root = -1;
    std::filesystem::path _files; ///< directory of the contents that replaceFile mounted
};

} // namespace Orv::Test

/** Goes on only where namespaces can be made: elsewhere the test is skipped with the reason, or fails under CI. */
#define REQUIRE_NAMESPACES() GO_ON_UNLESS(Orv::Test::whyNoNamespaces())
