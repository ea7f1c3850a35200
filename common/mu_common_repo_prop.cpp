#include "common/mu_common_repo_prop.h"

#include "common/mu_common_pattern.h"
#include "common/mu_common_translate.h"

#include "platform/sdk/OdError.h"
#include "platform/ut/Dir.h"
#include "platform/ut/FileName.h"
#include "platform/ut/TextFile.h"
#include "platform/ut/text.h"

#include <algorithm>
#include <string>
#include <variant>

namespace common {

namespace {

constexpr int kEverybody = 0777; // less the umask

constexpr wchar_t const* kDefaultRules[] = {LR"(^.*\.bak$)", LR"(^.*\.dwl$)", LR"(^.*\.dwl2$)"};

OdString join(OdString const& folder, OdString const& name)
{
    return folder + ut::FileName::getPathSeparator() + name;
}

OdString withoutTrailingSeparators(OdString const& path)
{
    std::size_t length = path.getLength();
    while (length > 0 && ut::FileName::isPathSeparator(path.getAt(length - 1))) {
        --length;
    }
    return path.left(length);
}

OdString conflictCopy(OdString const& file, wchar_t const* suffix)
{
    return join(join(L".tav", L"conflict"), ut::FileName(file).getName() + suffix);
}

OdString ignoreFileOf(RootPath const& root)
{
    return join(root.propertiesPath(), L"ignore");
}

} // namespace

RootPath::RootPath(OdString const& path) : root_(ut::correctSlashes(withoutTrailingSeparators(path))) {}

Expected<RootPath> RootPath::get(OdString const& path, bool create)
{
    if (ut::Dir::exists(tavPath(path))) {
        return RootPath(path);
    }
    if (!create) {
        return ErrorMessage(translate(L"Path: %ls is not a tav directory."), path.c_str());
    }
    if (!ut::FileName::mkdir(path, kEverybody, ut::FileName::kFullPath)) {
        return ErrorMessage(translate(L"Not able to create the version control folder: %ls"), path.c_str());
    }
    if (!ut::Dir::create(tavPath(path))) {
        return ErrorMessage(translate(L"Not able to create a tav directory in %ls"), path.c_str());
    }
    return RootPath(path);
}

OdString RootPath::tavPath(OdString const& path)
{
    return join(path, L".tav");
}

OdString RootPath::tavPath() const
{
    return tavPath(root_);
}

OdString RootPath::statePath() const
{
    return join(tavPath(), L"tav.state");
}

OdString RootPath::dbPath() const
{
    return join(tavPath(), L"tav.db");
}

OdString RootPath::propertiesPath() const
{
    return join(tavPath(), L"properties");
}

OdString RootPath::logPath() const
{
    return join(tavPath(), L"tav.log");
}

OdString RootPath::conflictPath() const
{
    return join(tavPath(), L"conflict");
}

OdString RootPath::path() const
{
    return root_;
}

OdString RootPath::pathTo(OdString const& relative) const
{
    return join(root_, relative);
}

OdString RootPath::conflictPathTo(OdString const& relative) const
{
    return join(conflictPath(), relative);
}

OdString RootPath::relativeToTheirs(OdString const& file) const
{
    return conflictCopy(file, L".theirs.dwg");
}

OdString RootPath::relativeToBase(OdString const& file) const
{
    return conflictCopy(file, L".base.dwg");
}

Expected<OdString> RootPath::relativePathTo(OdString const& path) const
{
    OdString const prefix = join(root_, OdString::kEmpty);
    if (path.left(prefix.getLength()) != prefix) {
        return ErrorMessage(translate(L"%ls is not located in the current repository"));
    }
    return path.mid(prefix.getLength());
}

OdString repositoryExt()
{
    return L"tf";
}

RepoIgnore::RepoIgnore(RootPath const& root) : ignorePath_(ignoreFileOf(root))
{
    load();
}

void RepoIgnore::load()
{
    ut::TextFile file(ignorePath_);
    if (!file.exists()) {
        for (wchar_t const* rule : kDefaultRules) {
            append(rule);
        }
        return;
    }
    if (!file.open()) { // Without its rules a scan would offer what is meant to stay out.
        OdString message;
        throw OdError(message.format(L"Could not read Ignore file '%ls'.", ignorePath_.c_str()));
    }
    for (OdString line = file.getFirstLine(); !line.isEmpty(); line = file.getNextLine()) {
        append(line);
    }
}

void RepoIgnore::append(OdString const& rule)
{
    expressions_.push_back(compile(rule));
    rules_.push_back(rule);
}

OdString RepoIgnore::ignorePath() const
{
    return ignorePath_;
}

std::vector<std::regex> RepoIgnore::expressions() const
{
    return expressions_;
}

std::vector<OdString> RepoIgnore::rules() const
{
    return rules_;
}

bool RepoIgnore::matches(OdString const& name) const
{
    std::string const narrow = name.ansi_str();
    return std::any_of(expressions_.begin(), expressions_.end(), [&](std::regex const& expression) {
        return matchesWhole(expression, narrow);
    });
}

WriteOutcome RepoIgnore::write(RootPath const& root)
{
    ut::TextFile file(ignoreFileOf(root));
    if (file.exists()) {
        return WriteOutcome(std::in_place);
    }
    file.create();
    for (wchar_t const* rule : kDefaultRules) {
        file.addLine(rule);
    }
    if (!file.write()) {
        return ErrorMessage(L"Failed to write Ignore file.");
    }
    return WriteOutcome(std::in_place);
}

std::regex RepoIgnore::compile(OdString const& rule)
{
    return compilePattern(rule, kLongestName);
}

} // namespace common
