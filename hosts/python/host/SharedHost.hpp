#pragma once

#include <pybind11/pybind11.h>

#include <filesystem>
#include <mutex>
#include <optional>

#include "hosts/embedded/Host.hpp"
#include "hosts/python/InterpreterLock.hpp"

namespace tessel::python {

// SharedHost is the one Host of a Python process.
//
// Ownership: the Host is never destroyed, so that instances may die at any
//   time while the interpreter ends.
// Threads: any; a Host is for one thread at a time, so calls of several wait
//   for each other. Nobody holds the mutex together with the interpreter's
//   lock: a call cannot wait for Python, and Python runs on meanwhile.
// Fork: waits for the end of a running call, so that a child gets a Host
//   between two calls.
class SharedHost {
public:
    // The plug-in that the loader finds by its own name; without a value if it
    // finds none.
    static std::optional<std::filesystem::path> installedPlugin();

    // Makes the Host, if there is none yet, and loads the plug-in, unless the
    // class is there already.
    //
    // messages  the folder of the message catalogue
    // Throws HostException if the file cannot be loaded, and
    // std::runtime_error if this process has a host of its own.
    static void start(const std::filesystem::path& plugin,
                      const std::filesystem::path& messages);

    // Does work with the Host, without the interpreter's lock, and returns what
    // the work returns. The Host must have been started.
    template <class Work>
    static auto with(Work work) {
        const Turn turn;
        return work(*host);
    }

private:
    // One call's use of the Host. The interpreter's lock is given back first
    // and taken last.
    class Turn {
    public:
        Turn() { mutex.lock(); }
        Turn(const Turn&) = delete;
        Turn& operator=(const Turn&) = delete;
        ~Turn() { mutex.unlock(); }

    private:
        InterpreterReleased released_;
    };

    // NOLINTBEGIN(cppcoreguidelines-avoid-non-const-global-variables)
    static std::mutex mutex;
    static embedded::Host* host;  // guarded by mutex
    // NOLINTEND(cppcoreguidelines-avoid-non-const-global-variables)
};

}  // namespace tessel::python
