/// Results: a value, or a message that says why there is none.
///
/// Failures that a caller has to expect (bad data, a full disk, a missing file) are returned as the error of an
/// `Expected`; the types here live in the global namespace. All of them are plain values without locks.
#pragma once

#include "common/mu_common_export.h"

#include "platform/sdk/OdError.h"
#include "platform/sdk/OdString.h"

#include <cassert>
#include <cstdint>
#include <type_traits>
#include <utility>
#include <variant>

/// Why something failed, in words for people.
struct ErrorMessage {
    /// Keeps `text` unchanged: nothing in it is treated as a placeholder.
    explicit ErrorMessage(OdString const& text) : message(text) {}

    /// Holds `format` with its placeholders filled in by `OdString::format`; `%ls` takes a `wchar_t const*`.
    /// Nothing is translated here: a caller that wants a translated message passes the translated format. A text that
    /// came from outside (a path, a key) goes into `args`, never into `format`.
    template <class First, class... Rest>
    ErrorMessage(OdString const& format, First&& first, Rest&&... rest)
    {
        message.format(format.c_str(), std::forward<First>(first), std::forward<Rest>(rest)...);
    }

    OdString message;      ///< finished: formatted, and translated where the caller asked for it
    std::int32_t code = 0; ///< 0 in every message that the library builds; kept for callers that number theirs
};

/// Either an `ErrorMessage` (alternative 0) or a `T` (alternative 1). Copyable when `T` is.
/// Dropping a result unread is a warning: the failure would go unnoticed.
template <class T>
class [[nodiscard]] Expected {
public:
    /// The error state.
    Expected(ErrorMessage error) : content_(std::in_place_index<0>, std::move(error)) {}
    /// The value state.
    Expected(T&& value) : content_(std::in_place_index<1>, std::move(value)) {}
    /// The value state, by copy.
    Expected(T const& value) : content_(std::in_place_index<1>, value) {}

    /// Builds the value in place.
    Expected(std::in_place_t) : content_(std::in_place_index<1>) {}

    /// Builds the value in place from `first` and from what remains of `rest` after passing through temporaries.
    ///
    /// Each argument after the first is passed to a temporary of its own type, which is destroyed at once. A copyable
    /// argument is copied and stays intact. A move-only argument is moved, so an owner (a `std::unique_ptr`) arrives
    /// EMPTY at the value, and what it owned is destroyed. Readers of server documents rely on that; do not pass owners
    /// whose objects you want to keep. Aggregates can be built too.
    template <class First, class... Rest>
    Expected(std::in_place_t, First&& first, Rest&&... rest)
        : Expected(
              AfterTemporaries{}, (passThroughTemporary(std::forward<Rest>(rest)), ..., 0), std::forward<First>(first),
              std::forward<Rest>(rest)...)
    {
    }

    /// Calls `visitor` with the held alternative as an rvalue (`T&&` or `ErrorMessage&&`) and returns what it returns.
    template <class Visitor>
    auto visit(Visitor&& visitor) && -> decltype(auto)
    {
        return std::visit(std::forward<Visitor>(visitor), std::move(content_));
    }

    /// Whether there is a value and no error.
    bool hasValue() const noexcept { return content_.index() == 1; }

    /// The value of a result that has one; lives as long as the result.
    T const& value() const&
    {
        assert(hasValue());
        return *std::get_if<1>(&content_);
    }
    /// Moves it out of a temporary result, so that it can be used in a loop: `for (auto& file : collect().value())`.
    T value() &&
    {
        assert(hasValue());
        return std::move(*std::get_if<1>(&content_));
    }

    /// The message of a result that has no value; lives as long as the result.
    ErrorMessage const& error() const&
    {
        assert(!hasValue());
        return *std::get_if<0>(&content_);
    }
    /// Moves it out of a temporary result.
    ErrorMessage error() &&
    {
        assert(!hasValue());
        return std::move(*std::get_if<0>(&content_));
    }

private:
    struct AfterTemporaries {};

    template <class... Args>
    Expected(AfterTemporaries, int, Args&&... args)
        : content_(std::in_place_index<1>, build(std::forward<Args>(args)...))
    {
    }

    template <class Arg>
    static void passThroughTemporary(Arg&& arg)
    {
        using Value = std::decay_t<Arg>;
        if constexpr (std::is_copy_constructible_v<Value>) {
            [[maybe_unused]] Value const temporary(arg);
        } else if constexpr (!std::is_lvalue_reference_v<Arg>) {
            [[maybe_unused]] Value const temporary(std::forward<Arg>(arg));
        }
    }

    template <class... Args>
    static T build(Args&&... args)
    {
        if constexpr (std::is_constructible_v<T, Args...>) {
            return T(std::forward<Args>(args)...);
        } else {
            return T{std::forward<Args>(args)...};
        }
    }

    std::variant<ErrorMessage, T> content_;
};

/// The result of everything that only succeeds or fails, such as writing a file.
using WriteOutcome = Expected<std::monostate>;

namespace mu_common_detail {
[[noreturn]] MU_COMMON_EXPORT void throwNoValue();
}

/// Visitor that takes the value out of an `Expected` or throws:
/// `T value = std::move(expected).visit(GetRValueOrThrow<T>{});`
///
/// On an error it throws `OdError` with one fixed sentence; the message of the error is not in it. A caller that needs
/// the reason must check the result before taking the value out.
template <class T>
struct GetRValueOrThrow {
    /// Returns the value.
    T&& operator()(T&& value) const { return std::move(value); }
    /// Throws; never returns.
    T&& operator()(ErrorMessage&&) const { mu_common_detail::throwNoValue(); }
};
