// SPDX-License-Identifier: Apache-2.0
#include "interrupt.h"

#include <csignal>
#include <cstdlib>
#include <initializer_list>

namespace tool {
namespace {

volatile std::sig_atomic_t noted_signal = 0;  // a signal handler can reach nothing but a static

extern "C" void note_signal(int signal) { noted_signal = signal; }

}  // namespace

void note_interrupts() {
    for (const int signal : {SIGINT, SIGTERM, SIGHUP}) {
        struct sigaction action {};
        if (sigaction(signal, nullptr, &action) != 0 || action.sa_handler == SIG_IGN) continue;
        action = {};
        action.sa_handler = note_signal;  // without SA_RESTART: a read that waits for input must return
        sigemptyset(&action.sa_mask);
        sigaction(signal, &action, nullptr);
    }
}

void throw_if_interrupted() {
    if (noted_signal != 0) throw Interrupted{noted_signal};
}

void end_by(int signal) {
    std::signal(signal, SIG_DFL);
    std::raise(signal);
    std::_Exit(128 + signal);
}

}  // namespace tool
