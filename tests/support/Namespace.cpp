#include "tests/support/Namespace.h"

#include <array>
#include <cerrno>
#include <cstdio>
#include <exception>
#include <fstream>
#include <stdexcept>
#include <system_error>
#include <thread>

#include <fcntl.h>
#include <sched.h>
#include <sys/mount.h>
#include <sys/wait.h>
#include <unistd.h>

namespace Orv::Test {

namespace {

[[noreturn]] void fail(const std::string& what) {
    throw std::system_error(errno, std::generic_category(), what);
}

void check(int result, const std::string& what) {
    if (result < 0) {
        fail(what);
    }
}

/** Runs `work` on a thread of its own, for what changes the thread it runs on, and passes on what it throws. */
void onOwnThread(const std::function<void()>& work) {
    std::exception_ptr thrown;
    std::thread([&] {
        try {
            work();
        } catch (...) {
            thrown = std::current_exception();
        }
    }).join();
    if (thrown) {
        std::rethrow_exception(thrown);
    }
}

int openNamespace(const char* kind) {
    const std::string path = std::string("/proc/thread-self/ns/") + kind;
    const int descriptor = open(path.c_str(), O_RDONLY | O_CLOEXEC);
    check(descriptor, path);
    return descriptor;
}

void makeNamespaces() {
    check(unshare(CLONE_NEWNET | CLONE_NEWNS), "unshare(network, mounts)");
}

/**
 * Only mount points can be made private, and the root directory of a chroot need not be one: it is bound onto itself
 * then. "/.." leads onto a mount that covers the root directory, "/" does not.
 */
void makeMountsPrivate() {
    if (mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0) {
        return;
    }
    if (errno != EINVAL) {
        fail("mount / private");
    }
    check(mount("/", "/", nullptr, MS_BIND | MS_REC, nullptr), "bind / onto itself");
    check(chdir("/.."), "chdir /..");
    check(chroot("."), "chroot");
    check(mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr), "mount / private");
}

/** A sysfs shows the network namespace in which it was mounted, so the new one needs a sysfs of its own. */
void mountOwnSys() {
    makeMountsPrivate();
    check(mount("sysfs", "/sys", "sysfs", 0, nullptr), "mount sysfs");
}

std::string readAll(FILE* stream) {
    std::string text;
    std::array<char, 4096> buffer{};
    while (const std::size_t length = fread(buffer.data(), 1, buffer.size(), stream)) {
        text.append(buffer.data(), length);
    }
    return text;
}

} // namespace

std::string whyNoNamespaces() {
    try {
        onOwnThread(makeNamespaces);
        return {};
    } catch (const std::system_error& error) {
        return std::string("namespaces cannot be made here, which needs root: ") + error.what();
    }
}

Namespace::Namespace() {
    onOwnThread([this] {
        makeNamespaces();
        mountOwnSys();
        _network = openNamespace("net");
        _mounts = openNamespace("mnt");
        _root = open("/", O_PATH | O_DIRECTORY | O_CLOEXEC);
        check(_root, "/");
    });
    std::string name = (std::filesystem::temp_directory_path() / "marlo-namespace-XXXXXX").string();
    if (mkdtemp(name.data()) == nullptr) {
        fail(name);
    }
    _files = name;
}

Namespace::~Namespace() {
    close(_network);
    close(_mounts);
    close(_root);
    std::error_code ignored;
    std::filesystem::remove_all(_files, ignored);
}

void Namespace::enter() const {
    // A thread enters a mount namespace only when it shares its root and working directory with no other thread.
    check(unshare(CLONE_FS), "unshare(fs)");
    check(setns(_mounts, CLONE_NEWNS), "setns(mounts)");
    // It arrives in the root directory of the namespace, which is not this process's own in a chroot.
    check(fchdir(_root), "fchdir(root)");
    check(chroot("."), "chroot");
    check(setns(_network, CLONE_NEWNET), "setns(network)");
}

void Namespace::run(const std::function<void()>& work) const {
    onOwnThread([&] {
        enter();
        work();
    });
}

std::string Namespace::shell(const std::string& command) const {
    std::string output;
    int status = 0;
    run([&] {
        const std::string line = "exec 2>&1; " + command;
        FILE* stream = popen(line.c_str(), "re");
        if (stream == nullptr) {
            fail(command);
        }
        output = readAll(stream);
        status = pclose(stream);
    });
    if (status != 0) {
        throw std::runtime_error(command + ": exit " + std::to_string(WEXITSTATUS(status)) + ": " + output);
    }
    return output;
}

std::string Namespace::ip(const std::string& arguments) const {
    return shell("ip " + arguments);
}

void Namespace::ipBatch(const std::string& lines) const {
    const std::filesystem::path file = _files / "batch";
    std::ofstream(file) << lines;
    shell("ip -batch " + file.string());
}

void Namespace::replaceFile(const std::string& path, const std::string& content) {
    std::string name = path;
    for (char& character : name) {
        character = character == '/' ? '%' : character;
    }
    const std::filesystem::path file = _files / name;
    const bool mounted = std::filesystem::exists(file);
    std::ofstream(file) << content;
    if (!mounted) {
        run([&] { check(mount(file.c_str(), path.c_str(), nullptr, MS_BIND, nullptr), "mount over " + path); });
    }
}

std::string Namespace::descriptorPath() const {
    return "/proc/" + std::to_string(getpid()) + "/fd/" + std::to_string(_network);
}

} // namespace Orv::Test
