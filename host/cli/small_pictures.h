/// Small pictures of stored drawings between the lines of a list.
#pragma once

#include "host/pictures/terminal.h"

#include "common/mu_common_repo_prop.h"

#include <cstddef>
#include <string>

namespace tav {

/// A list with more drawings goes through the pager, which shows no pictures.
inline constexpr std::size_t kMostSmallPictures = 20;

class SmallPictures {
public:
    /// For the repository `root`. Pictures are shown where standard output is a terminal that can show them, and
    /// nowhere else.
    explicit SmallPictures(common::RootPath root);

    bool canBeShown() const { return protocol_ != PictureProtocol::none; }

    /// What shows the content at `url` of the file `path`, on lines of its own. Empty when that is no drawing, has no
    /// picture, or cannot be read: a list is worth more than its pictures.
    std::string textFor(OdString const& url, OdString const& path) const;

private:
    common::RootPath root_;
    PictureProtocol protocol_;
};

} // namespace tav
