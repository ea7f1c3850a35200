#include "common/mu_common_repo_files.h"

#include "common/mu_common_translate.h"
#include "common/mu_common_versions.h"

#include "platform/qut/toQt.h"
#include "platform/sdk/OdTimeStamp.h"
#include "platform/ut/File.h"

#include <QFile>
#include <QTextStream>

#include <algorithm>
#include <array>
#include <string>
#include <utility>
#include <vector>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace common {

namespace {

struct ChangeName {
    FileChange change;
    wchar_t const* text;
};

constexpr std::array<ChangeName, 3> kChangeNames = {{
    {FileChange::added, L"added"},
    {FileChange::modified, L"modified"},
    {FileChange::removed, L"removed"},
}};

/// Opens the regular file `path`, or makes it; -1 when that fails. Qt would encode the path by the process's locale, in
/// which names of other scripts may have no form, and would wait at a pipe until somebody reads from it.
int openForAppending(std::string const& path)
{
    constexpr mode_t kEverybody = 0666; // less the umask
    if (path.find('\0') != path.npos) {
        return -1;
    }
    int const file = open(path.c_str(), O_WRONLY | O_APPEND | O_CREAT | O_CLOEXEC | O_NONBLOCK | O_NOCTTY, kEverybody);
    struct stat status {};
    if (file >= 0 && (fstat(file, &status) != 0 || !S_ISREG(status.st_mode))) {
        close(file);
        return -1;
    }
    return file;
}

/// The digest of all bytes that the file had when it was opened; from the first that cannot be read, of zeros.
OdString digestOf(OdString const& path)
{
    constexpr std::size_t kPiece = 1 << 18;
    ut::File file;
    file.open(path, ut::File::kRead);
    ContentDigest digest;
    std::vector<char> buffer(kPiece);
    bool isReadable = true;
    for (std::uint64_t left = file.length(); left > 0;) {
        std::size_t const wanted = static_cast<std::size_t>(std::min<std::uint64_t>(left, kPiece));
        std::size_t const got = isReadable ? file.read(buffer.data(), wanted) : 0;
        isReadable = got == wanted;
        std::fill(buffer.begin() + static_cast<std::ptrdiff_t>(got), buffer.end(), '\0');
        digest.update(buffer.data(), wanted);
        left -= wanted;
    }
    return digest.finish();
}

} // namespace

Expected<OdString> toString(FileChange change)
{
    for (ChangeName const& name : kChangeNames) {
        if (name.change == change) {
            return OdString(name.text);
        }
    }
    return ErrorMessage(translate(L"unsupported file change"));
}

Expected<FileChange> toFileChange(OdString const& text)
{
    for (ChangeName const& name : kChangeNames) {
        if (text == OdString(name.text)) {
            return FileChange(name.change);
        }
    }
    return ErrorMessage(translate(L"Unsupported file change enum: %ls"), text.c_str());
}

StagedFile::StagedFile(OdString const& stagedPath, FileChange stagedChange) : path(stagedPath), change(stagedChange) {}

bool StagedFile::operator==(StagedFile const& other) const
{
    return path == other.path && change == other.change;
}

BaseFile::BaseFile(OdString const& filePath) : path(filePath) {}

BaseFile::~BaseFile() = default;

RepoFile::RepoFile(OdString const& filePath, OdString const& storage) : BaseFile(filePath), storagePath(storage) {}

RepoFile::RepoFile(OdString const& filePath, OdString const& storage, std::unique_ptr<BaseFile> previous)
    : BaseFile(filePath)
    , storagePath(storage)
    , base(std::move(previous))
{
}

PossibleRepoFile::PossibleRepoFile(OdString const& filePath) : path(filePath) {}

PossibleRepoFile::PossibleRepoFile(OdString const& filePath, OdString const& storage)
    : path(filePath)
    , storagePath(storage)
{
}

PossibleRepoFile::PossibleRepoFile(OdString const& filePath, OdString const& storage, OdString const& previous)
    : path(filePath)
    , storagePath(storage)
    , previousPath(previous)
{
}

PossibleRepoFile::PossibleRepoFile(OdString const& filePath, boost::optional<OdString> const& storage)
    : path(filePath)
    , storagePath(storage)
{
}

PossibleRepoFile::PossibleRepoFile(
    OdString const& filePath, boost::optional<OdString> const& storage, OdString const& previous)
    : path(filePath)
    , storagePath(storage)
    , previousPath(previous)
{
}

Versions<VersionedFile, std::shared_ptr<File>>::Versions(VersionedFile received) : current(std::move(received)) {}

Versions<VersionedFile, std::shared_ptr<File>>::Versions(
    VersionedFile received, std::unique_ptr<File> renamedFrom, std::unique_ptr<MetaInfo> info)
    : metaInfo(std::move(info))
    , current(std::move(received))
    , previous(std::move(renamedFrom))
{
}

bool logString(OdString const& text, RootPath const& root)
{
    QFile file(qut::toQt(root.logPath()));
    int const handle = openForAppending(root.logPath().ansi_str());
    if (handle < 0 || !file.open(handle, QIODevice::WriteOnly | QIODevice::Append, QFileDevice::AutoCloseHandle)) {
        return false;
    }
    OdString time;
    OdTimeStamp(OdTimeStamp::kInitLocalTime).ctime(time);
    QTextStream stream(&file);
    stream.setCodec("UTF-8"); // The default one follows the locale and drops what that cannot express.
    stream << qut::toQt(time) << " - " << qut::toQt(text) << "\n";
    return true;
}

bool isDifferent(OdString const& relativePath, OdString const& hash, RootPath const& root)
{
    if (hash.left(2) == repositoryExt()) {
        return true;
    }
    return digestOf(root.pathTo(relativePath)) != hash.mid(3);
}

} // namespace common
