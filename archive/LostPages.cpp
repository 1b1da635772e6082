#include "archive/LostPages.hpp"

#include <sys/mman.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdint>
#include <mutex>

namespace tessel::archive {
namespace {

using Range = LostPages::Range;

// A handler can reach nothing but globals.
// NOLINTBEGIN(cppcoreguidelines-avoid-non-const-global-variables)
std::mutex changingRanges;
std::atomic<Range*> ranges = nullptr;  // changed under the mutex only
struct sigaction before;               // what handled SIGBUS before us
std::size_t pageBytes = 0;
// NOLINTEND(cppcoreguidelines-avoid-non-const-global-variables)

#ifdef SYS_mmap2
constexpr long mapCall = SYS_mmap2;  // SYS_mmap takes other arguments here
#else
constexpr long mapCall = SYS_mmap;
#endif

// ---- In the handler: nothing but atomics and system calls ----

// False, too, for a range that another thread just changes: no range that
// somebody reads does.
bool holds(const Range& range, std::size_t address) noexcept {
    const unsigned changes = range.changes.load();
    const std::size_t start = range.start.load();
    const std::size_t bytes = range.bytes.load();
    return changes % 2 == 0 && range.changes.load() == changes &&
           address >= start && address - start < bytes;
}

// Puts a page of zeros in place of the one with this address, if a range has
// it. Just that page: what the disk still delivers stays readable.
bool replacePage(std::size_t address) noexcept {
    for (Range* range = ranges.load(); range != nullptr; range = range->next) {
        if (!holds(*range, address)) continue;
        range->lost.store(true);
        // The system call itself: nothing says that a handler may call mmap.
        return ::syscall(mapCall, address - address % pageBytes, pageBytes,
                         PROT_READ, MAP_PRIVATE | MAP_ANONYMOUS | MAP_FIXED, -1,
                         0) != -1;
    }
    return false;
}

// Handles the signal as if we were not there.
void passOn(int signal, siginfo_t* about, void* context) noexcept {
    const bool isSent = about->si_code <= 0;  // by a process, not by a fault
    if ((before.sa_flags & SA_SIGINFO) != 0)
        return before.sa_sigaction(signal, about, context);
    if (before.sa_handler != SIG_DFL && before.sa_handler != SIG_IGN)
        return before.sa_handler(signal);
    if (isSent && before.sa_handler == SIG_IGN) return;
    // A fault comes again after the return, and cannot be ignored.
    struct sigaction usual {};
    usual.sa_handler = SIG_DFL;
    ::sigaction(signal, &usual, nullptr);
    if (isSent) ::raise(signal);
}

void onBusError(int signal, siginfo_t* about, void* context) {
    const int error = errno;
    if (about->si_code <= 0 ||
        !replacePage(reinterpret_cast<std::size_t>(about->si_addr)))
        passOn(signal, about, context);
    errno = error;
}

// ---- Outside of it ----

// Sets the handler; takes it away when the library is unloaded.
class Handler {
public:
    Handler() noexcept {
        pageBytes = static_cast<std::size_t>(::sysconf(_SC_PAGESIZE));
        struct sigaction ours {};
        ours.sa_sigaction = &onBusError;
        ours.sa_flags = SA_SIGINFO | SA_ONSTACK | SA_RESTART;
        ::sigaction(SIGBUS, nullptr, &before);
        ::sigaction(SIGBUS, &ours, nullptr);
    }
    Handler(const Handler&) = delete;
    Handler& operator=(const Handler&) = delete;
    ~Handler() {
        struct sigaction now {};
        if (::sigaction(SIGBUS, nullptr, &now) == 0 &&
            (now.sa_flags & SA_SIGINFO) != 0 && now.sa_sigaction == &onBusError)
            ::sigaction(SIGBUS, &before, nullptr);
    }
};

// A free range, or a new one. The mutex must be held.
Range& freeRange() {
    for (Range* range = ranges.load(); range != nullptr; range = range->next)
        if (range->bytes.load() == 0) return *range;
    auto range = std::make_unique<Range>();
    range->next = ranges.load();
    ranges.store(range.get());
    return *range.release();
}

void change(Range& range, std::size_t start, std::size_t bytes) noexcept {
    ++range.changes;
    range.start.store(start);
    range.bytes.store(bytes);
    range.lost.store(false);
    ++range.changes;
}

}  // namespace

LostPages::LostPages(const void* start, std::size_t bytes) {
    static const Handler handler;
    const std::lock_guard lock(changingRanges);
    Range& range = freeRange();
    change(range, reinterpret_cast<std::size_t>(start), bytes);
    range_.reset(&range);
}

void LostPages::Release::operator()(Range* range) const noexcept {
    const std::lock_guard lock(changingRanges);
    change(*range, 0, 0);
}

}  // namespace tessel::archive
