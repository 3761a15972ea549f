#pragma once

#include <thread>

namespace TestSupport {

// Calls edit(0), edit(1) and so on from another thread, at least 20 times, while `run` runs on this one.
// Races show under the thread sanitizer.
template <typename Edit, typename Run>
void WhileAnotherThread(Edit edit, Run run) {
    const std::jthread other([&](const std::stop_token& stop) {
        for (int round = 0; round < 20 || !stop.stop_requested(); ++round) {
            edit(round);
            std::this_thread::yield();
        }
    });
    run();
}

}  // namespace TestSupport
