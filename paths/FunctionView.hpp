#pragma once

#include <concepts>
#include <memory>
#include <type_traits>
#include <utility>

namespace tessel {

template <class Signature>
class FunctionView;

// FunctionView refers to something that can be called, for as long as one
// call of a function takes it as an argument.
//
// Ownership: keeps the address of the callable, which must outlive it.
// Cost: two pointers; an indirect call.
template <class Result, class... Arguments>
class FunctionView<Result(Arguments...)> {
public:
    template <class Callable>
    requires(!std::same_as<std::remove_cvref_t<Callable>, FunctionView> &&
             std::is_invocable_r_v<Result, Callable&, Arguments...>)
        // Implicit, so that a lambda can be passed where a view is expected.
        FunctionView(Callable&& callable)
    noexcept  // NOLINT(google-explicit-*)
        : callable_(const_cast<void*>(
              static_cast<const void*>(std::addressof(callable)))),
          call_(&callAs<std::remove_reference_t<Callable>>) {}

    Result operator()(Arguments... arguments) const {
        return call_(callable_, std::forward<Arguments>(arguments)...);
    }

private:
    template <class Callable>
    static Result callAs(void* callable, Arguments... arguments) {
        return static_cast<Result>((*static_cast<Callable*>(callable))(
            std::forward<Arguments>(arguments)...));
    }

    void* callable_;
    Result (*call_)(void*, Arguments...);
};

}  // namespace tessel
