/// What differs between the pictures of two versions of a drawing.
#pragma once

#include "host/pictures/image.h"

#include <cstdint>

namespace tav {

/// One picture for people, and its figures in pixels.
struct Comparison {
    Image picture; ///< the version before, the version after, and what differs, side by side
    std::uint64_t removed = 0;
    std::uint64_t added = 0;
    std::uint64_t recolored = 0;
};

/// The colors of what differs. People who do not see colors well can tell them apart.
constexpr Color kRemovedColor = {213, 94, 0};
constexpr Color kAddedColor = {0, 114, 178};
constexpr Color kRecoloredColor = {204, 121, 167};
constexpr Color kUnchangedColor = {190, 190, 190};

/// Compares what is drawn: the most frequent color of a picture is its ground and not compared, so that a drawing seen
/// on black and the same one seen on white are alike. Of two sizes the larger picture is made smaller first; one of
/// other proportions is set into the middle.
Comparison compare(Image const& before, Image const& after);

} // namespace tav
