#include "host/repository/ignore_file.h"

#include "host/errors/failure.h"

#include "platform/os/os_open_file.h"
#include "platform/ut/FileName.h"
#include "platform/ut/TextFile.h"
#include "platform/ut/text.h"

#include <algorithm>
#include <regex>

namespace tav {

namespace {

constexpr char const* kCheckDisk = "Check the free space and your rights in '.tav'.";

OdString pathOf(common::RootPath const& root)
{
    return root.propertiesPath() + ut::FileName::getPathSeparator() + L"ignore";
}

/// Where the list of rules ends in the text of an ignore file: at its first empty line, or its end.
std::size_t endOfRules(OdString const& text)
{
    std::size_t lineStart = 0;
    for (std::size_t i = 0; i < text.getLength(); ++i) {
        if (text.getAt(i) != L'\n') {
            continue;
        }
        OdString const line = text.mid(lineStart, i - lineStart);
        if (line.isEmpty() || line == OdString(L"\r")) {
            return lineStart;
        }
        lineStart = i + 1;
    }
    return text.getLength();
}

OdString withoutLineEnd(OdString const& line)
{
    std::size_t length = line.getLength();
    while (length > 0 && (line.getAt(length - 1) == L'\n' || line.getAt(length - 1) == L'\r')) {
        --length;
    }
    return line.left(length);
}

OdString withoutRule(OdString const& text, OdString const& rule)
{
    std::size_t const end = endOfRules(text);
    OdString changed;
    for (std::size_t begin = 0; begin < end;) {
        std::size_t next = begin;
        while (next < end && text.getAt(next) != L'\n') {
            ++next;
        }
        OdString const line = text.mid(begin, next + 1 - begin);
        if (withoutLineEnd(line) != rule) {
            changed += line;
        }
        begin = next + 1;
    }
    return changed + text.mid(end);
}

OdString withRule(OdString const& text, OdString const& rule)
{
    std::size_t const end = endOfRules(text);
    OdString changed = text.left(end);
    if (end > 0 && text.getAt(end - 1) != L'\n') {
        changed += L'\n';
    }
    changed += rule;
    if (end < text.getLength()) {
        changed += L'\n';
    }
    return changed + text.mid(end);
}

void writeRules(OdString const& path, OdString const& text)
{
    ut::TextFile file(path);
    file.create();
    file.addLine(text);
    if (!file.write()) {
        throw Failure("The ignore file '" + path.ansi_str() + "' cannot be written.", kCheckDisk);
    }
}

bool contains(std::vector<OdString> const& rules, OdString const& rule)
{
    return std::find(rules.begin(), rules.end(), rule) != rules.end();
}

} // namespace

void requireRules(common::RootPath const& root)
{
    std::string const path = pathOf(root).ansi_str();
    os::OpenFile probe;
    std::error_code const error = probe.openForReading(path);
    if (error && error != std::errc::no_such_file_or_directory && error != std::errc::not_a_directory) {
        throw Failure(
            "The ignore file '" + path + "' cannot be read: " + error.message() + ".",
            "Check it and your permissions for it.");
    }
}

std::vector<OdString> ignoreRules(common::RootPath const& root)
{
    requireRules(root);
    try {
        return common::RepoIgnore(root).rules();
    } catch (std::regex_error const&) {
        throw Failure(
            "The ignore file '" + pathOf(root).ansi_str() + "' has a rule that is not a valid regular expression.",
            "Correct or remove it there.");
    }
}

void makeIgnoreFile(common::RootPath const& root)
{
    if (!ut::FileName::mkdir(root.propertiesPath(), 0777, ut::FileName::kFullPath)) {
        throw Failure("The folder '" + root.propertiesPath().ansi_str() + "' cannot be made.", kCheckDisk);
    }
    valueOrFail(common::RepoIgnore::write(root), kCheckDisk);
}

bool hasIgnoreFile(common::RootPath const& root)
{
    return ut::FileName::fileExists(pathOf(root));
}

void requireValidRule(OdString const& rule)
{
    bool const holdsLineEnd =
        rule != OdString(rule.c_str()) || rule.ansi_str().find_first_of("\r\n") != std::string::npos;
    if (rule.isEmpty() || holdsLineEnd) {
        throw Failure("A rule is one line that is not empty.", "Give one rule at a time.");
    }
    try {
        common::RepoIgnore::compile(rule);
    } catch (std::regex_error const&) {
        throw Failure(
            "'" + rule.ansi_str() + "' is not a valid regular expression.",
            "Rules match whole names: write '^.*\\.tmp$' for all names that end in '.tmp'.");
    }
}

bool addIgnoreRule(common::RootPath const& root, OdString const& rule)
{
    requireValidRule(rule);
    makeIgnoreFile(root);
    if (contains(ignoreRules(root), rule)) {
        return false;
    }
    writeRules(pathOf(root), withRule(ut::readEntireFile(pathOf(root)), rule));
    return true;
}

bool removeIgnoreRule(common::RootPath const& root, OdString const& rule)
{
    if (!contains(ignoreRules(root), rule)) {
        return false;
    }
    makeIgnoreFile(root);
    writeRules(pathOf(root), withoutRule(ut::readEntireFile(pathOf(root)), rule));
    return true;
}

} // namespace tav
