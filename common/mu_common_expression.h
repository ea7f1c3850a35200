/// The structure of regular expressions. Internal to the library.
#pragma once

#include <cstddef>
#include <string_view>
#include <vector>

namespace common {

/// A regular expression in the ECMAScript grammar as a tree.
struct Expression {
    enum class Kind {
        characters, ///< one character of several: itself, `.`, a class
        assertion,  ///< `^`, `$`, `\b`, `\B`
        backReference,
        group,
        lookAhead,
        repetition,
        sequence,
        alternatives
    };

    static constexpr std::size_t kEndless = ~std::size_t{0};

    Kind kind = Kind::sequence;
    std::string_view text{};         ///< of characters and assertions, as they are written
    std::vector<Expression> parts{}; ///< a group, look-ahead or repetition has one
    std::size_t number = 0;          ///< of a group that is captured, or of the one referred to; counted from 1
    std::size_t least = 1;           ///< of a repetition
    std::size_t most = 1;            ///< of a repetition, or `kEndless`
};

/// Reads `text`, which must outlive the result. Throws `std::regex_error` for an expression that is nested too deeply
/// for the recursive functions that examine it, and for one of more than `kMostParts` characters and groups. Other
/// errors are left to the standard library's compiler: the tree of an expression that it refuses has no meaning.
Expression readExpression(std::string_view text);

/// Whether `expression` is of the kind `kind` or has a part that is.
bool contains(Expression const& expression, Expression::Kind kind);

constexpr std::size_t kMostParts = 1 << 14;

/// Throws the `std::regex_error` of an expression that would take too much stack, memory or time.
[[noreturn]] void refuseExpression();

} // namespace common
