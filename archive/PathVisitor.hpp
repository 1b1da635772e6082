#pragma once

#include <concepts>
#include <cstdint>
#include <memory>
#include <string_view>
#include <type_traits>

namespace tessel {

class PathVisitor;

// A function object that takes a path's number and its bytes.
template <class Callable>
concept VisitsPaths =
    std::is_class_v<std::remove_cvref_t<Callable>> &&
    !std::same_as<std::remove_cvref_t<Callable>, PathVisitor> &&
    std::is_invocable_v<Callable&, std::uint64_t, std::string_view>;

// Refers to a function object, such as a lambda, that is shown paths one by
// one: it takes a path's number and its bytes. If it returns a bool, false
// ends the visit; if it returns nothing, all paths are visited.
//
// The view is valid until the call returns. What the call throws ends the
// visit and reaches the caller.
//
// Ownership: borrows the function object, which must outlive the PathVisitor.
//   A lambda written in the call's argument list does.
// Cost: two pointers; a call is one indirect call, never an allocation.
class PathVisitor {
public:
    // Implicit, so that a lambda can be handed over as it is.
    template <VisitsPaths Callable>
    // NOLINTNEXTLINE(google-explicit-constructor,bugprone-forwarding-reference-overload)
    PathVisitor(Callable&& callable) noexcept
        : target_(const_cast<void*>(
              static_cast<const void*>(std::addressof(callable)))),
          call_(&callAs<std::remove_reference_t<Callable>>) {}

    // Whether the visit goes on.
    bool operator()(std::uint64_t number, std::string_view path) const {
        return call_(target_, number, path);
    }

private:
    template <class Callable>
    static bool callAs(void* target, std::uint64_t number,
                       std::string_view path) {
        auto& visit = *static_cast<Callable*>(target);
        if constexpr (std::is_void_v<decltype(visit(number, path))>)
            return visit(number, path), true;
        else
            return static_cast<bool>(visit(number, path));
    }

    void* target_;
    bool (*call_)(void*, std::uint64_t, std::string_view);
};

}  // namespace tessel
