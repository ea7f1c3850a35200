/// Files of settings: each a JSON object of texts.
#pragma once

#include "json/json_value.h"

#include <optional>
#include <string>
#include <vector>

namespace tav {

/// The content of one such file. Members that this tav does not know are kept.
class ConfigFile {
public:
    /// Reads the file `path`; a missing one is empty. Throws `Failure` for anything else than a file of settings.
    explicit ConfigFile(std::string path);

    /// The names of all members, in ascending order.
    std::vector<std::string> keys() const;
    /// None when the member is missing or is not a text.
    std::optional<std::string> text(std::string const& key) const;

    void set(std::string const& key, std::string const& value);
    /// False when there is no such member.
    bool remove(std::string const& key);

    /// Replaces the file, whole. The caller keeps others from changing it since it was read. Throws `Failure`.
    void save() const;

private:
    std::string path_;
    kutils::json::Object members_;
};

} // namespace tav
