// poster DATABASE URL NAME: posts from three threads in bursts until it is killed. What is on disk is said on
// standard output, a line for each: NAME.THREAD.COUNT. With no NAME it posts nothing and ends when all has been sent.

#include "host/delivery/Delivery.h"

#include <random>
#include <thread>
#include <vector>

#include <unistd.h>

namespace {

using namespace marlo;
using delivery::Delivery;

Instance alert(const std::string& text) {
    Instance instance;
    instance.path.className = "LAB_Alert";
    instance.properties = {{"Description", Value::string(text)}};
    return instance;
}

[[noreturn]] void postForEver(Delivery& delivery, const std::string& name) {
    std::minstd_rand numbers{std::random_device()()};
    const std::vector<std::string> subscriptions{"a"};
    for (int count = 0;; ++count) {
        const std::string text = name + "." + std::to_string(count);
        delivery.wait(delivery.post(subscriptions, alert(text)));
        const std::string line = text + "\n";
        if (::write(STDOUT_FILENO, line.data(), line.size()) < 0) {
            ::_exit(1);
        }
        if (numbers() % 20 == 0) {
            std::this_thread::sleep_for(std::chrono::milliseconds(numbers() % 10));
        }
    }
}

} // namespace

int main(int count, char** arguments) {
    if (count < 3) {
        return 2;
    }
    delivery::Options options;
    options.firstRetry = std::chrono::milliseconds(5);
    options.lastRetry = std::chrono::milliseconds(20);
    options.deletionTime = std::chrono::milliseconds(20);
    Delivery delivery(
        arguments[1], options, [](const std::string& /*key*/, delivery::OnFatalError /*policy*/) {},
        [](const std::string& /*line*/) {});
    delivery.setDestination({"a", arguments[2], true, {}});
    delivery.setSubscription({"a", "a", delivery::OnFatalError::ignore, {}});
    delivery.start();
    if (count == 3) {
        while (delivery.counters().front().queued != 0) {
            std::this_thread::sleep_for(std::chrono::milliseconds(5));
        }
        return 0;
    }
    std::vector<std::thread> threads;
    for (int thread = 0; thread < 3; ++thread) {
        threads.emplace_back(postForEver, std::ref(delivery),
                             std::string(arguments[3]) + "." + std::to_string(thread));
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
}
