#include "hosts/python/Interruptible.hpp"

#include <pybind11/pybind11.h>

#include <chrono>
#include <exception>
#include <future>
#include <system_error>

#include "hosts/python/InterpreterLock.hpp"

namespace tessel::python {

namespace {

namespace py = pybind11;

constexpr std::chrono::milliseconds betweenTicks(50);

std::future<void> started(FunctionRef<void()> work) {
    try {
        return std::async(std::launch::async, [work] { work(); });
    } catch (const std::system_error&) {
        return std::async(std::launch::deferred, [work] { work(); });
    }
}

// Lets Python handle signals. Returns what it or `tick` raised.
std::exception_ptr tickOnce(FunctionRef<void()> tick) {
    const InterpreterHeld held;
    try {
        if (PyErr_CheckSignals() != 0) throw py::error_already_set();
        tick();
    } catch (...) {
        return std::current_exception();
    }
    return nullptr;
}

}  // namespace

void runInterruptibly(std::stop_source& stop, FunctionRef<void()> work,
                      FunctionRef<void()> tick) {
    const InterpreterReleased released;
    std::future<void> ending = started(work);
    while (ending.wait_for(betweenTicks) == std::future_status::timeout) {
        const std::exception_ptr raised = tickOnce(tick);
        if (raised == nullptr) continue;
        stop.request_stop();
        ending.wait();
        std::rethrow_exception(raised);
    }
    ending.get();
}

}  // namespace tessel::python
