#pragma once

#include <initializer_list>
#include <span>
#include <string_view>

#include "hosts/embedded/HostException.hpp"
#include "hosts/embedded/MessageCatalogue.hpp"

namespace tessel::embedded {

// Errors makes HostExceptions with their texts.
//
// Ownership: refers to the catalogue, which must outlive it.
class Errors {
public:
    explicit Errors(const MessageCatalogue& catalogue)
        : catalogue_(catalogue) {}

    [[noreturn]] void raise(
        std::string_view identifier,
        std::span<const HostMessageArgument> arguments) const;

    // Raises an error of the host's own, by its key.
    [[noreturn]] void raiseOwn(
        std::string_view key,
        std::initializer_list<HostMessageArgument> arguments = {}) const;

    // Runs an action of a class or method. What it throws becomes a host
    // error: no memory is the host's out-of-memory error, any other native
    // exception an error that carries its text. Host errors pass.
    template <class Action>
    auto guarded(std::string_view what, Action action) const {
        try {
            return action();
        } catch (const HostException&) {
            throw;
        } catch (const std::bad_alloc&) {
            raiseOwn("outOfMemory");
        } catch (const std::exception& exception) {
            raiseOwn("nativeError", {std::string(what), exception.what()});
        } catch (...) {
            raiseOwn("nativeError",
                     {std::string(what), "an unknown exception"});
        }
    }

private:
    const MessageCatalogue& catalogue_;
};

}  // namespace tessel::embedded
