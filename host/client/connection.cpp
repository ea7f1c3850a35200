#include "host/client/connection.h"

#include "host/errors/failure.h"
#include "host/text/characters.h"
#include "host/text/json_text.h"
#include "host/text/utf8.h"
#include "host/user/user_folders.h"

#include "common/mu_common_serialization.h"
#include "json/json_reader.h"

#include <algorithm>
#include <cstddef>
#include <filesystem>
#include <string_view>
#include <utility>

namespace tav {

namespace {

OdString const kVersion = L"1";
constexpr char const* kCheckFolder = "Check the folder of the server.";

/// The server takes names that can be shown.
OdString withoutControls(OdString const& name)
{
    OdString clean;
    for (std::size_t i = 0; i < name.getLength(); ++i) {
        clean += isControl(name.getAt(i)) ? L'_' : name.getAt(i);
    }
    return clean;
}

bool isAsciiLetter(char character)
{
    return (character >= 'a' && character <= 'z') || (character >= 'A' && character <= 'Z');
}

bool isUrl(std::string const& typed)
{
    auto const isSchemeCharacter = [](char character) {
        return isAsciiLetter(character) || std::string_view("0123456789+.-").find(character) != std::string_view::npos;
    };
    std::size_t const scheme = typed.find("://");
    return scheme != std::string::npos && isAsciiLetter(typed.front()) &&
           std::all_of(typed.begin(), typed.begin() + static_cast<std::ptrdiff_t>(scheme), isSchemeCharacter);
}

} // namespace

std::string defaultServerFolder()
{
    return userFolder("XDG_DATA_HOME", ".local/share") + "/tav/server";
}

OdString namedServerFolder(std::string const& typed)
{
    if (isUrl(typed)) {
        throw Failure("'" + typed + "' is a URL, and servers are reached through folders only.", "Name a folder.");
    }
    std::filesystem::path const path = std::filesystem::absolute(typed).lexically_normal();
    return fromUtf8(path.has_filename() ? path.string() : path.parent_path().string());
}

void failIfInside(OdString const& server, std::string const& workingFolder)
{
    std::filesystem::path const relative = std::filesystem::weakly_canonical(server.ansi_str())
                                               .lexically_relative(std::filesystem::weakly_canonical(workingFolder));
    auto const isHidden = [](std::filesystem::path const& part) { return part != "." && part.string().front() == '.'; };
    if (std::none_of(relative.begin(), relative.end(), isHidden)) {
        throw Failure(
            "'" + server.ansi_str() + "' is inside the working folder.", "Name a folder outside of it for the server.");
    }
}

std::unique_ptr<Server> connect(OdString const& folder, EmbeddedServer::Missing missing)
{
    auto server = std::make_unique<EmbeddedServer>(folder.ansi_str(), missing);
    auto const answer = server->request(L"version", OdString::kEmpty);
    if (!answer.hasValue()) {
        bool const isGone = answer.error().code == static_cast<std::int32_t>(ServerError::noServer);
        throw Failure(
            answer.error(), isGone ? "If it has a new place, run 'tav server FOLDER'."
                                   : "The folder of the server is '" + folder.ansi_str() + "'.");
    }
    OdString const version = valueOrFail(common::deserializeServerVersion(answer.value()), "Ask its owner.");
    if (version != kVersion) {
        throw Failure(
            "The server in '" + folder.ansi_str() + "' speaks version " + version.ansi_str() + ", this tav version " +
                kVersion.ansi_str() + ".",
            "Use a tav that supports that version.");
    }
    return server;
}

OdString makeRepository(OdString const& folder, std::string const& name, OdString const& id)
{
    kutils::json::Object object;
    if (!id.isEmpty()) {
        object[L"id"] = jsonText(id);
    }
    object[L"name"] = jsonText(withoutControls(fromUtf8(name)));
    OdString const answer = valueOrFail(
        connect(folder, EmbeddedServer::Missing::isMade)->request(L"init", compactText(std::move(object))),
        kCheckFolder);
    kutils::json::Value document;
    kutils::json::read_string(document, answer);
    return valueOrFail(common::deserializeInitData(document.get_object()), kCheckFolder);
}

std::vector<OdString> repositoriesIn(OdString const& folder)
{
    OdString const answer = valueOrFail(
        connect(folder, EmbeddedServer::Missing::isAnError)->request(L"repositories", OdString::kEmpty), kCheckFolder);
    std::vector<OdString> repositories;
    for (common::RepoData const& data : valueOrFail(common::deserializeRepoDatas(answer), kCheckFolder)) {
        repositories.push_back(data.id);
    }
    return repositories;
}

void requireServer(LocalDatabase const& database)
{
    if (database.repositoryId().isEmpty()) {
        throw Failure("The repository has no server yet.", "Run 'tav init' to complete it.");
    }
}

Connection::Connection(LocalDatabase const& database)
    : Connection((requireServer(database), database.serverFolder()), database.repositoryId())
{
}

Connection::Connection(OdString const& serverFolder, OdString repository)
    : folder_(serverFolder)
    , repository_(std::move(repository))
    , server_(connect(serverFolder, EmbeddedServer::Missing::isAnError))
{
}

OdString Connection::request(char const* verb, OdString const& document)
{
    auto const answer = server_->request(OdString(verb, CP_UTF_8) + L" " + repository_, document);
    auto const kind = static_cast<ServerError>(answer.hasValue() ? 0 : answer.error().code);
    return valueOrFail(
        answer, kind == ServerError::noRepository
                    ? "The folder of the server is '" + folder_.ansi_str() +
                          "'. Run 'tav server FOLDER' with the one that has it, or add --send to make it there."
                : kind == ServerError::inUse
                    ? "'tav revert' makes one that does the opposite. Your working folder is as it was."
                    : "Your working folder is as it was.");
}

} // namespace tav
