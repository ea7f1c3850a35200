/// A catalogue that shows which texts are translated.
#pragma once

#include <string>
#include <vector>

namespace server {

/// While it lives, the user's language is one in which each of `texts` reads "{text}". A message in braces was
/// translated, and one with a filled placeholder inside them was translated first.
class Translations {
public:
    explicit Translations(std::vector<std::string> const& texts);
    Translations(Translations const&) = delete;
    Translations& operator=(Translations const&) = delete;
    ~Translations();
};

} // namespace server
