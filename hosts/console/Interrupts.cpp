#include "hosts/console/Interrupts.hpp"

#include <sys/eventfd.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdint>
#include <system_error>

#include "archive/ArchiveExceptions.hpp"
#include "hosts/console/ProgressBar.hpp"

namespace tessel::console {

namespace {

// Ends the listener's wait; nobody else has a use for it here.
constexpr int wakeUp = SIGUSR2;

bool isIgnored(int signal) noexcept {
    struct sigaction action {};
    ::sigaction(signal, nullptr, &action);
    return action.sa_handler == SIG_IGN;
}

sigset_t handledSignals() noexcept {
    sigset_t signals;
    ::sigemptyset(&signals);
    ::sigaddset(&signals, SIGINT);
    ::sigaddset(&signals, SIGTERM);
    if (!isIgnored(SIGHUP)) ::sigaddset(&signals, SIGHUP);
    ::sigaddset(&signals, wakeUp);
    return signals;
}

void setAction(int signal, void (*handler)(int)) noexcept {
    struct sigaction action {};
    action.sa_handler = handler;
    ::sigaction(signal, &action, nullptr);
}

}  // namespace

Interrupts::Interrupts()
    : wake_(::eventfd(0, EFD_CLOEXEC)), ignoredPipe_(isIgnored(SIGPIPE)) {
    if (wake_ < 0)
        throw std::system_error(errno, std::generic_category(), "eventfd");
    setAction(SIGPIPE, SIG_IGN);
    // An ignored signal would never arrive. Shells start background commands
    // with SIGINT ignored, but `kill -INT` means what it says.
    setAction(SIGINT, SIG_DFL);
    const sigset_t signals = handledSignals();
    ::pthread_sigmask(SIG_BLOCK, &signals, nullptr);
    try {
        listener_ = std::thread([this] { listen(); });
    } catch (const std::system_error& failure) {
        throw std::system_error(failure.code(), "cannot start a thread");
    }
}

Interrupts::~Interrupts() {
    ends_ = true;
    ::pthread_kill(listener_.native_handle(), wakeUp);
    listener_.join();
    ::close(wake_);
}

void Interrupts::throwIfStopped() const {
    if (stop_.stop_requested()) throw CancelledException();
}

void Interrupts::endByClosedPipe() const noexcept {
    if (!ignoredPipe_) {
        setAction(SIGPIPE, SIG_DFL);
        ::raise(SIGPIPE);
    }
    ::_exit(128 + SIGPIPE);
}

void Interrupts::listen() noexcept {
    const sigset_t signals = handledSignals();
    for (;;) {
        int signal = 0;
        if (::sigwait(&signals, &signal) != 0) continue;
        if (signal == wakeUp) {
            if (ends_) return;
            continue;
        }
        if (!tidiesUp_ || signal_ != 0) {
            ProgressBar::wipe();
            ::_exit(128 + signal);
        }
        signal_ = signal;
        stop_.request_stop();
        const std::uint64_t one = 1;
        static_cast<void>(::write(wake_, &one, sizeof one) == sizeof one);
    }
}

}  // namespace tessel::console
