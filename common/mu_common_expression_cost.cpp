#include "common/mu_common_expression_cost.h"

#include "common/mu_common_expression_ways.h"

#include <algorithm>
#include <string_view>

namespace common {

namespace {

using Kind = Expression::Kind;

// Measured with libstdc++ 12: a level takes some 100 bytes of stack to compile or to match at once, 150 way by way.
constexpr double kMostLevels = 8192; // 1.2 MiB
constexpr double kLevelsOfAGroup = 9;
// A state takes some 50 bytes, that of a class some hundreds.
constexpr double kMostStates = kMostParts;
// A step takes up to 40 ns: the worst expressions take half a second for a name that is made for them. Those that users
// write stay far below: a list of 250 names, or a word that comes twice, is compiled and matched in a millisecond.
constexpr double kMostSteps = 1 << 24;
// Compiling a class asks the locale about each of 256 characters: 0.13 ms.
constexpr double kStepsOfAClass = 1 << 12;
// Of a look-ahead: the marks of that many states are cleared for each character.
constexpr double kStatesOfAStep = 1024;
constexpr double kUnbounded = 1e9; // Keeps products finite.

double capped(double value)
{
    return std::min(value, kUnbounded);
}

/// Positions in a text of `length` characters where something may begin.
struct Positions {
    double length;
    double states = 0; ///< of the whole automaton
    double first = 0;
    double last = 0;

    double count() const { return std::min(last, length) - std::min(first, length) + 1; }
    Positions behind(double shortest, double longest) const
    {
        return {length, states, first + shortest, last + longest};
    }
};

struct Cost {
    double states = 0;       ///< of the automaton
    double emptyStates = 0;  ///< those that read no character, through which matching recurses
    double levels = 0;       ///< of recursion to compile
    double aheadLevels = 0;  ///< of recursion in look-aheads, which end before matching goes on
    double perCharacter = 1; ///< levels that one round of a loop takes for each character, way by way
    double shortest = 0;     ///< what is covered
    double longest = 0;
    double steps = 0; ///< to match at once
    double pairs = 0; ///< of alternatives
    double classes = 0;
};

Cost costOf(Expression const& expression, Positions at);

void addPart(Cost& cost, Cost const& part)
{
    cost.states += part.states;
    cost.emptyStates += part.emptyStates;
    cost.aheadLevels += part.aheadLevels;
    cost.perCharacter = std::max(cost.perCharacter, part.perCharacter);
    cost.steps += part.steps;
    cost.pairs += part.pairs;
    cost.classes += part.classes;
}

Cost costOfSequence(Expression const& expression, Positions at)
{
    Cost cost;
    double index = 0; // The compiler recurses from one part to the next.
    for (Expression const& part : expression.parts) {
        Cost const next = costOf(part, at.behind(cost.shortest, cost.longest));
        addPart(cost, next);
        cost.levels = std::max(cost.levels, ++index + next.levels);
        cost.shortest = capped(cost.shortest + next.shortest);
        cost.longest = capped(cost.longest + next.longest);
    }
    return cost;
}

Cost costOfAlternatives(Expression const& expression, Positions at)
{
    Cost cost;
    cost.shortest = kUnbounded;
    double const count = static_cast<double>(expression.parts.size());
    for (Expression const& part : expression.parts) {
        Cost const next = costOf(part, at);
        addPart(cost, next);
        cost.levels = std::max(cost.levels, next.levels);
        cost.shortest = std::min(cost.shortest, next.shortest);
        cost.longest = std::max(cost.longest, next.longest);
    }
    cost.states += 2 * count;
    cost.emptyStates += count;
    cost.steps += count * at.count();
    cost.pairs += count * count;
    return cost;
}

Cost costOfGroup(Expression const& expression, Positions at)
{
    Cost cost = costOf(expression.parts.front(), at);
    cost.states += 2;
    cost.emptyStates += 2;
    cost.levels += kLevelsOfAGroup;
    cost.steps += 2 * at.count();
    return cost;
}

Cost costOfLookAhead(Expression const& expression, Positions at)
{
    Cost cost = costOf(expression.parts.front(), {at.length, at.states});
    double const characters = std::min(cost.longest, at.length);
    cost.states += 2;
    cost.aheadLevels += cost.emptyStates + kLevelsOfAGroup;
    cost.emptyStates = 1;
    cost.levels += kLevelsOfAGroup;
    cost.shortest = cost.longest = 0;
    cost.steps = at.count() * (stepsToLookAhead(at.states) + characters * at.states / kStatesOfAStep + cost.steps);
    return cost;
}

// The automaton gets a copy of what is repeated for each round that is counted, one for the loop behind them, and a
// state for each choice to leave.
Cost costOfRepetition(Expression const& expression, Positions at)
{
    bool const isEndless = expression.most == Expression::kEndless;
    double const least = static_cast<double>(expression.least);
    double const copies = std::max(isEndless ? least + 1 : static_cast<double>(expression.most), 1.0);
    double const exits = isEndless ? 1 : copies - std::min(least, copies);
    Positions const inside = at.behind(0, expression.most > 1 ? kUnbounded : 0);
    Cost cost = costOf(expression.parts.front(), inside);
    if (expression.most > 1) {
        double const levels = 1 + (cost.emptyStates + 1) / std::max(cost.shortest, 1.0);
        cost.perCharacter = std::max(cost.perCharacter, levels);
    }
    cost.states = copies * cost.states + exits;
    cost.emptyStates = copies * cost.emptyStates + exits;
    cost.steps = copies * cost.steps + exits * inside.count();
    cost.pairs *= copies;
    cost.shortest = capped(least * cost.shortest);
    cost.longest = capped((isEndless ? kUnbounded : copies) * cost.longest);
    return cost;
}

/// A class that is repeated is compiled once.
bool isClass(std::string_view text)
{
    constexpr std::string_view kNamed = "dDsSwW";
    return text.front() == '[' || (text.size() == 2 && kNamed.find(text[1]) != kNamed.npos);
}

Cost costOf(Expression const& expression, Positions at)
{
    switch (expression.kind) {
    case Kind::sequence: return costOfSequence(expression, at);
    case Kind::alternatives: return costOfAlternatives(expression, at);
    case Kind::group: return costOfGroup(expression, at);
    case Kind::lookAhead: return costOfLookAhead(expression, at);
    case Kind::repetition: return costOfRepetition(expression, at);
    default: break;
    }
    Cost cost;
    bool const isCharacter = expression.kind == Kind::characters;
    cost.states = 1;
    cost.emptyStates = isCharacter ? 0 : 1;
    cost.shortest = isCharacter ? 1 : 0;
    cost.longest = expression.kind == Kind::backReference ? kUnbounded : cost.shortest;
    cost.steps = at.count() * stepsOfALook(expression);
    cost.classes = isCharacter && isClass(expression.text) ? 1 : 0;
    return cost;
}

void refuseUnless(bool isWithinBounds)
{
    if (!isWithinBounds) {
        refuseExpression();
    }
}

} // namespace

void checkCompiling(Expression const& expression)
{
    Cost const cost = costOf(expression, {0});
    refuseUnless(cost.levels <= kMostLevels && cost.states <= kMostStates);
    refuseUnless(cost.pairs + cost.classes * kStepsOfAClass <= kMostSteps);
}

void checkMatchingAtOnce(Expression const& expression, std::size_t longestText)
{
    double const states = costOf(expression, {0}).states;
    Cost const cost = costOf(expression, {static_cast<double>(longestText), states});
    refuseUnless(cost.emptyStates + cost.aheadLevels <= kMostLevels && cost.steps <= kMostSteps);
}

void checkMatchingWayByWay(Expression const& expression, std::size_t longestText)
{
    Cost const cost = costOf(expression, {0});
    refuseUnless(cost.perCharacter * kLongestText + cost.emptyStates + cost.aheadLevels <= kMostLevels);
    refuseUnless(stepsWayByWay(expression, longestText, cost.states) <= kMostSteps);
}

} // namespace common
