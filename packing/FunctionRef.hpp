#pragma once

#include <concepts>
#include <memory>
#include <type_traits>
#include <utility>

namespace tessel {

template <class Signature>
class FunctionRef;

// A function object, other than a Self, that a FunctionRef can refer to.
template <class Callable, class Self, class Result, class... Arguments>
concept CallableAs = std::is_class_v<std::remove_cvref_t<Callable>> &&
                     !std::same_as<std::remove_cvref_t<Callable>, Self> &&
                     std::is_invocable_r_v<Result, Callable&, Arguments...>;

// Refers to a function object, such as a lambda, without owning it, as
// std::string_view refers to text: for parameters that are called only before
// the function returns.
//
// Ownership: borrows the function object, which must outlive the FunctionRef.
//   A lambda written in the call's argument list does.
// Cost: two pointers; a call is one indirect call, never an allocation.
template <class Result, class... Arguments>
class FunctionRef<Result(Arguments...)> {
public:
    // Implicit, so that a lambda can be handed over as it is.
    template <CallableAs<FunctionRef, Result, Arguments...> Callable>
    // NOLINTNEXTLINE(google-explicit-constructor,bugprone-forwarding-reference-overload)
    FunctionRef(Callable&& callable) noexcept
        : target_(const_cast<void*>(
              static_cast<const void*>(std::addressof(callable)))),
          call_(&callAs<std::remove_reference_t<Callable>>) {}

    Result operator()(Arguments... arguments) const {
        return call_(target_, std::forward<Arguments>(arguments)...);
    }

private:
    template <class Callable>
    static Result callAs(void* target, Arguments... arguments) {
        return static_cast<Result>((*static_cast<Callable*>(target))(
            std::forward<Arguments>(arguments)...));
    }

    void* target_;
    Result (*call_)(void*, Arguments...);
};

}  // namespace tessel
