#include "common/mu_common_expression.h"

#include <algorithm>
#include <regex>
#include <utility>

namespace common {

namespace {

using Kind = Expression::Kind;

// One level of nesting takes some 850 bytes of stack to compile.
constexpr std::size_t kMostOpenGroups = 100;
// As in `a{2}{3}`. Each is one more level of the tree.
constexpr std::size_t kMostRepeatedRepetitions = 100;
constexpr std::string_view kDigits = "0123456789";

Expression nodeOf(Kind kind, std::string_view text = {})
{
    Expression node;
    node.kind = kind;
    node.text = text;
    return node;
}

Expression nodeAround(Kind kind, Expression part)
{
    Expression node = nodeOf(kind);
    node.parts.push_back(std::move(part));
    return node;
}

class Reader {
public:
    explicit Reader(std::string_view text) : rest_(text) {}

    Expression alternatives()
    {
        Expression node = nodeOf(Kind::alternatives);
        node.parts.push_back(sequence());
        while (skip("|")) {
            count();
            node.parts.push_back(sequence());
        }
        return node.parts.size() == 1 ? Expression(std::move(node.parts.front())) : node;
    }

private:
    Expression sequence()
    {
        Expression node;
        while (!rest_.empty() && rest_.front() != '|' && rest_.front() != ')') {
            node.parts.push_back(term());
        }
        return node;
    }

    Expression term()
    {
        Expression node = atom();
        bool isRepeated = false;
        while (!rest_.empty() && kQuantifiers.find(rest_.front()) != kQuantifiers.npos) {
            repeated_ += isRepeated ? 1 : 0;
            if (repeated_ > kMostRepeatedRepetitions) {
                refuseExpression();
            }
            node = repetition(std::move(node));
            isRepeated = true;
        }
        return node;
    }

    Expression atom()
    {
        count();
        switch (rest_.front()) {
        case '(': return group();
        case '[': return nodeOf(Kind::characters, take(lengthOfClass()));
        case '\\': return escape();
        case '^':
        case '$': return nodeOf(Kind::assertion, take(1));
        default: return nodeOf(Kind::characters, take(1));
        }
    }

    Expression group()
    {
        if (++open_ > kMostOpenGroups) {
            refuseExpression();
        }
        bool const isLookAhead = skip("(?=") || skip("(?!");
        bool const isCaptured = !isLookAhead && !skip("(?:") && skip("(");
        std::size_t const number = isCaptured ? ++groups_ : 0;
        Expression node = nodeAround(isLookAhead ? Kind::lookAhead : Kind::group, alternatives());
        node.number = number;
        skip(")");
        --open_;
        return node;
    }

    Expression escape()
    {
        char const what = rest_.size() > 1 ? rest_[1] : '\0';
        if (what == 'b' || what == 'B') {
            return nodeOf(Kind::assertion, take(2));
        }
        if (what >= '1' && what <= '9') {
            take(1);
            Expression node = nodeOf(Kind::backReference);
            node.number = number();
            return node;
        }
        std::size_t const length = what == 'x' ? 4 : what == 'u' ? 6 : what == 'c' ? 3 : 2;
        return nodeOf(Kind::characters, take(length));
    }

    /// A bracket inside `[:alpha:]` and its like, or behind a backslash, does not end the class.
    std::size_t lengthOfClass() const
    {
        std::size_t end = 1;
        while (end < rest_.size() && rest_[end] != ']') {
            std::size_t const closing = endOfName(end);
            end = closing != rest_.npos ? closing : end + (rest_[end] == '\\' ? 2 : 1);
        }
        return end + 1;
    }

    std::size_t endOfName(std::size_t begin) const
    {
        char const mark = rest_[begin] == '[' && begin + 1 < rest_.size() ? rest_[begin + 1] : '\0';
        if (mark != ':' && mark != '.' && mark != '=') {
            return rest_.npos;
        }
        char const closing[] = {mark, ']'};
        std::size_t const end = rest_.find(std::string_view(closing, 2), begin + 2);
        return end == rest_.npos ? end : end + 2;
    }

    Expression repetition(Expression part)
    {
        Expression node = nodeAround(Kind::repetition, std::move(part));
        char const mark = take(1).front();
        node.least = mark == '+' ? 1 : 0;
        node.most = mark == '?' ? 1 : Expression::kEndless;
        if (mark == '{') {
            readBounds(node);
        }
        skip("?");
        return node;
    }

    /// `2}`, `2,}` or `2,5}`
    void readBounds(Expression& node)
    {
        node.least = node.most = number();
        if (skip(",")) {
            bool const isEndless = rest_.empty() || rest_.front() == '}';
            node.most = isEndless ? Expression::kEndless : number();
        }
        skip("}");
    }

    /// The standard library lets large numbers overflow.
    std::size_t number()
    {
        std::size_t const length = std::min(rest_.find_first_not_of(kDigits), rest_.size());
        std::size_t value = 0;
        for (char const c : take(length)) {
            value = value * 10 + static_cast<std::size_t>(c - '0');
            if (value > kMostParts) {
                refuseExpression();
            }
        }
        return value;
    }

    bool skip(std::string_view text)
    {
        bool const isNext = rest_.substr(0, text.size()) == text;
        take(isNext ? text.size() : 0);
        return isNext;
    }

    std::string_view take(std::size_t length)
    {
        std::string_view const taken = rest_.substr(0, length);
        rest_.remove_prefix(taken.size());
        return taken;
    }

    void count()
    {
        if (++parts_ > kMostParts) {
            refuseExpression();
        }
    }

    static constexpr std::string_view kQuantifiers = "*+?{";

    std::string_view rest_;
    std::size_t parts_ = 0;
    std::size_t groups_ = 0;
    std::size_t open_ = 0;
    std::size_t repeated_ = 0;
};

} // namespace

Expression readExpression(std::string_view text)
{
    return Reader(text).alternatives();
}

bool contains(Expression const& expression, Expression::Kind kind)
{
    return expression.kind == kind ||
           std::any_of(expression.parts.begin(), expression.parts.end(), [&](auto const& part) {
               return contains(part, kind);
           });
}

void refuseExpression()
{
    throw std::regex_error(std::regex_constants::error_complexity);
}

} // namespace common
