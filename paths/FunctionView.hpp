#pragma once

#include <memory>
#include <type_traits>
#include <utility>

namespace tessel {

template <class Signature>
class FunctionView;

// FunctionView refers to a function object, such as a lambda, for as long as
// one call takes it as an argument.
//
// Ownership: keeps the address of the callable, which must outlive it.
// Cost: two pointers; an indirect call.
template <class Result, class... Arguments>
class FunctionView<Result(Arguments...)> {
public:
    // Implicit, so that a lambda can be passed where a view is expected.
    // NOLINTBEGIN(google-explicit-constructor)
    template <
        class Callable,
        class = std::enable_if_t<
            std::is_class_v<std::remove_cvref_t<Callable>> &&
            !std::is_same_v<std::remove_cvref_t<Callable>, FunctionView> &&
            std::is_invocable_r_v<Result, Callable&, Arguments...>>>
    FunctionView(Callable&& callable) noexcept
        : callable_(const_cast<void*>(
              static_cast<const void*>(std::addressof(callable)))),
          call_(&callAs<std::remove_reference_t<Callable>>) {}
    // NOLINTEND(google-explicit-constructor)

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
