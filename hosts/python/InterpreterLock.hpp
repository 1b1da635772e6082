#pragma once

#include <cxxabi.h>
#include <pybind11/pybind11.h>
#include <unistd.h>

namespace tessel::python {

// Does work that may wait for the interpreter's lock. Python ends the threads
// that come back to an ending interpreter, by unwinding them. That would end
// the process by force in a destructor, or release Python's objects without
// the lock. So the thread waits here instead for the end of the process.
template <class Work>
auto takingInterpreter(Work work) noexcept {
    try {
        return work();
    } catch (const abi::__forced_unwind&) {
        while (true) pause();
    }
}

// While one lives, its thread is without the interpreter's lock, which it had.
class InterpreterReleased {
public:
    InterpreterReleased() : thread_(PyEval_SaveThread()) {}
    InterpreterReleased(const InterpreterReleased&) = delete;
    InterpreterReleased& operator=(const InterpreterReleased&) = delete;
    ~InterpreterReleased() {
        takingInterpreter([this] { PyEval_RestoreThread(thread_); });
    }

private:
    PyThreadState* thread_;
};

// While one lives, its thread has the interpreter's lock.
class InterpreterHeld {
public:
    InterpreterHeld() : state_(takingInterpreter(&PyGILState_Ensure)) {}
    InterpreterHeld(const InterpreterHeld&) = delete;
    InterpreterHeld& operator=(const InterpreterHeld&) = delete;
    ~InterpreterHeld() { PyGILState_Release(state_); }

private:
    PyGILState_STATE state_;
};

}  // namespace tessel::python
