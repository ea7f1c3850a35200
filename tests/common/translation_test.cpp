// Messages in the user's language. A program of its own: the translations that it installs are the process's.
#include "common/mu_common_json.h"
#include "common/mu_common_repo_files.h"
#include "common/mu_common_repo_prop.h"
#include "common/mu_common_serialization.h"

#include "tests/support/rows.h"
#include "tests/support/temp_folder.h"

#include <cstdlib>
#include <gmock/gmock.h>
#include <initializer_list>
#include <string>
#include <vector>
#include <wx/init.h>
#include <wx/translation.h>

namespace {

using common::FileChange;
using common::RootPath;
using kutils::json::Object;
using kutils::json::Value;
using kutils::json::Value_type;
using support::TempFolder;

struct Message {
    std::string english;
    std::string german;
};

std::string quoted(std::string const& text)
{
    std::string result = "\"";
    for (char const c : text) {
        switch (c) {
        case '\n': result += "\\n"; break;
        case '\t': result += "\\t"; break;
        case '"':
        case '\\': result += '\\'; [[fallthrough]];
        default: result += c; break;
        }
    }
    return result + "\"";
}

std::string catalogueOf(std::vector<Message> const& messages)
{
    std::string text = "msgid \"\"\nmsgstr \"Content-Type: text/plain; charset=UTF-8\\n\"\n";
    for (Message const& message : messages) {
        text += "\nmsgid " + quoted(message.english) + "\nmsgstr " + quoted(message.german) + "\n";
    }
    return text;
}

/// Installs a German catalogue for the process, as a host does, and takes it away again.
class Translation {
public:
    Translation(std::initializer_list<Message> messages, std::string const& domain = "mu_common") : domain_(domain)
    {
        compile(messages);
        wxFileTranslationsLoader::AddCatalogLookupPathPrefix(wxString::FromUTF8(folder_.path().c_str()));
        wxTranslations::Set(new wxTranslations);
        wxTranslations::Get()->SetLanguage("de");
        EXPECT_TRUE(wxTranslations::Get()->AddCatalog(domain_));
    }
    Translation(Translation const&) = delete;
    Translation& operator=(Translation const&) = delete;
    ~Translation() { wxTranslations::Set(nullptr); }

private:
    void compile(std::vector<Message> const& messages) const
    {
        folder_.write(domain_ + ".po", catalogueOf(messages));
        folder_.makeFolder("de/LC_MESSAGES");
        std::string const command = MU_MSGFMT " --output-file='" + folder_.pathTo("de/LC_MESSAGES/" + domain_ + ".mo") +
                                    "' '" + folder_.pathTo(domain_ + ".po") + "'";
        EXPECT_EQ(std::system(command.c_str()), 0) << command;
    }

    wxInitializer const wx_;
    std::string const domain_;
    TempFolder const folder_;
};

template <class T>
std::string errorOf(Expected<T> const& result)
{
    return result.hasValue() ? "no error" : result.error().message.ansi_str();
}

std::string openMissing()
{
    return errorOf(RootPath::get(L"/pl\u00E4ne/%n", false));
}

std::string makeBelowAFile()
{
    return errorOf(RootPath::get(L"/dev/null/pl\u00E4ne/%n", true));
}

// The working folder is there, and its ".tav" can be made nowhere below /proc.
std::string makeTavInProc()
{
    return errorOf(RootPath::get(L"/proc/self", true));
}

std::string locateElsewhere()
{
    return errorOf(RootPath(L"/w/proj").relativePathTo(L"/x/a.dwg"));
}

std::string nameUnknownChange()
{
    return errorOf(common::toString(static_cast<FileChange>(3)));
}

std::string readUnknownChange()
{
    return errorOf(common::toFileChange(L"ge\u00E4ndert %n"));
}

struct Translated {
    char const* name;
    Message format;
    std::string (*produce)();
    Message filled;
};

void PrintTo(Translated const& row, std::ostream* out)
{
    *out << row.name;
}

class TranslatedMessage : public testing::TestWithParam<Translated> {};

TEST_P(TranslatedMessage, IsEnglishWithoutTranslations)
{
    EXPECT_EQ(wxTranslations::Get(), nullptr);
    EXPECT_EQ(GetParam().produce(), GetParam().filled.english);
}

TEST_P(TranslatedMessage, IsEnglishWhenTheCatalogueLacksIt)
{
    Translation const translation{{"something else", "etwas anderes"}};
    EXPECT_EQ(GetParam().produce(), GetParam().filled.english);
}

TEST_P(TranslatedMessage, IsTranslatedBeforeItIsFilled)
{
    Translation const translation{GetParam().format};
    EXPECT_EQ(GetParam().produce(), GetParam().filled.german);
}

INSTANTIATE_TEST_SUITE_P(
    Messages, TranslatedMessage,
    testing::Values(
        Translated{
            "RootPathGetMissing",
            {"Path: %ls is not a tav directory.", "Kein Projektarchiv: %ls"},
            openMissing,
            {"Path: /pl\u00E4ne/%n is not a tav directory.", "Kein Projektarchiv: /pl\u00E4ne/%n"}},
        Translated{
            "RootPathGetFolder",
            {"Not able to create the version control folder: %ls",
             "Der Ordner \u201E%ls\u201C l\u00E4sst sich nicht anlegen"},
            makeBelowAFile,
            {"Not able to create the version control folder: /dev/null/pl\u00E4ne/%n",
             "Der Ordner \u201E/dev/null/pl\u00E4ne/%n\u201C l\u00E4sst sich nicht anlegen"}},
        Translated{
            "RootPathGetTav",
            {"Not able to create a tav directory in %ls", "In %ls entstand kein Projektarchiv"},
            makeTavInProc,
            {"Not able to create a tav directory in /proc/self", "In /proc/self entstand kein Projektarchiv"}},
        Translated{
            "RelativePathToKeepsThePlaceholder",
            {"%ls is not located in the current repository", "Au\u00DFerhalb des Projekts: %ls"},
            locateElsewhere,
            {"%ls is not located in the current repository", "Au\u00DFerhalb des Projekts: %ls"}},
        Translated{
            "ToString",
            {"unsupported file change", "unbekannte \u00C4nderung"},
            nameUnknownChange,
            {"unsupported file change", "unbekannte \u00C4nderung"}},
        Translated{
            "ToFileChange",
            {"Unsupported file change enum: %ls", "Unbekannte \u00C4nderung %ls!"},
            readUnknownChange,
            {"Unsupported file change enum: ge\u00E4ndert %n", "Unbekannte \u00C4nderung ge\u00E4ndert %n!"}}),
    support::rowName);

TEST(TranslatedText, IsTakenFromEveryCatalogueOfTheHost)
{
    Translation const translation({{"unsupported file change", "unbekannte \u00C4nderung"}}, "the_host");
    EXPECT_EQ(nameUnknownChange(), "unbekannte \u00C4nderung");
}

struct Slip {
    char const* name;
    char const* german;
    char const* result; // null: the English text
};

void PrintTo(Slip const& row, std::ostream* out)
{
    *out << row.name;
}

class CatalogueSlip : public testing::TestWithParam<Slip> {};

TEST_P(CatalogueSlip, ReadsNoArgumentThatIsNotThere)
{
    Translation const translation{{"Unsupported file change enum: %ls", GetParam().german}};
    char const* const english = "Unsupported file change enum: moved";
    EXPECT_EQ(errorOf(common::toFileChange(L"moved")), GetParam().result ? GetParam().result : english);
}

INSTANTIATE_TEST_SUITE_P(
    Placeholders, CatalogueSlip,
    testing::Values(
        Slip{"NarrowString", "Unbekannt: %s", nullptr}, Slip{"Number", "Unbekannt: %d", nullptr},
        Slip{"Counter", "Unbekannt: %n", nullptr}, Slip{"TwoForOne", "Unbekannt: %ls, %ls", nullptr},
        Slip{"AnotherKindBehindIt", "Unbekannt: %ls, %d", nullptr},
        Slip{"PositionBeyondTheLast", "Unbekannt: %2$ls", nullptr}, Slip{"PositionZero", "Unbekannt: %0$ls", nullptr},
        Slip{"PositionOfTwoDigits", "Unbekannt: %11$ls", nullptr},
        Slip{"PositionOfAnotherKind", "Unbekannt: %1$s", nullptr}, Slip{"PositionWithAWidth", "%1$5ls?", nullptr},
        Slip{"PositionBesideNone", "Unbekannt: %1$ls, %ls", nullptr}, Slip{"HalfAPosition", "Unbekannt: %1$", nullptr},
        Slip{"Position", "Unbekannt: %1$ls", "Unbekannt: moved"},
        Slip{"PositionTwice", "%1$ls? 100%% unbekannt: %1$ls", "moved? 100% unbekannt: moved"},
        Slip{"Width", "Unbekannt: %5ls", nullptr}, Slip{"WidthFromAnArgument", "Unbekannt: %*ls", nullptr},
        Slip{"OneCharacter", "Unbekannt: %lc", nullptr}, Slip{"UpperCase", "Unbekannt: %LS", nullptr},
        Slip{"LonePercentSign", "100% unbekannt: %ls", nullptr},
        Slip{"PercentSignAtTheEnd", "%ls unbekannt: 100%", nullptr}, Slip{"HalfAPlaceholder", "Unbekannt: %l", nullptr},
        Slip{"EscapedPercentSignBeforeAPlaceholder", "Unbekannt: %%%d", nullptr},
        Slip{"NoPlaceholder", "Unbekannt", "Unbekannt"},
        Slip{"EscapedPercentSign", "100%% unbekannt: %ls", "100% unbekannt: moved"},
        Slip{"EscapedPlaceholder", "%%ls unbekannt: %ls", "%ls unbekannt: moved"}, Slip{"Empty", "", nullptr}),
    support::rowName);

// Such a text is never formatted.
TEST(TranslationOfATextWithoutPlaceholder, MayHoldPercentSigns)
{
    for (char const* german : {"zu 100 % unbekannt", "%", "%s%n", "100%%", "%ls"}) {
        Translation const translation{{"unsupported file change", german}};
        EXPECT_EQ(nameUnknownChange(), german);
    }
}

TEST(TranslationOfTwoPlaceholders, MayChangeTheirOrder)
{
    struct {
        char const* german;
        char const* result;
    } const rows[] = {
        {R"("%2$ls" fehlt in %1$ls)", R"("name" fehlt in repo data)"},
        {R"(%1$ls ohne "%2$ls" (%1$ls))", R"(repo data ohne "name" (repo data))"},
        {"%1$ls ist unvollst\u00E4ndig", "repo data ist unvollst\u00E4ndig"},
        {R"("%2$ls" fehlt)", R"(Could not parse repo data, missing "name")"}, // The kind of the first would be a guess.
        {"%3$ls %2$ls %1$ls", R"(Could not parse repo data, missing "name")"},
        {"%2$ls %ls", R"(Could not parse repo data, missing "name")"}};
    for (auto const& row : rows) {
        Translation const translation{{R"(Could not parse %ls, missing "%ls")", row.german}};
        EXPECT_EQ(errorOf(common::deserializeRepoData(Object())), row.result) << row.german;
    }
}

TEST(CatalogueSlipInATextThatStaysUnfilled, IsNotShown)
{
    Translation const translation{{"%ls is not located in the current repository", "%s ist woanders"}};
    EXPECT_EQ(locateElsewhere(), "%ls is not located in the current repository");
}

std::string thrownBy(void (*read)())
{
    try {
        read();
    } catch (OdError const& error) {
        return error.description().ansi_str();
    }
    return "nothing was thrown";
}

TEST(UntranslatedMessage, IsWhatIsWrongWithADocument)
{
    Translation const translation{
        {"Unable to find json key '%ls'", "Kein %ls"},
        {"\nContext:\t%ls", "\nOrt: %ls"},
        {"\njson key:\t\"%ls\"", "\nName: %ls"},
        {"Error:\tExpected json type '%ls', found '%ls'", "Statt %ls: %ls"},
        {"Encounterd '%ls', found '%ls. While %ls'", "Statt %ls: %ls, %ls"},
        {"Encounterd '%ls', found '%ls. While %ls", "Statt %ls: %ls, %ls"},
        {"string", "Text"},
        {"object", "Objekt"},
        {"parsing json vector.", "beim Lesen"}};
    EXPECT_EQ(
        thrownBy([] { common::getStringValue(Object(), L"name", L"projects"); }),
        "Unable to find json key 'name'\nContext:\tprojects\njson key:\t\"name\"");
    EXPECT_EQ(thrownBy([] { common::getStringValue(Value(5)); }), "Error:\tExpected json type 'string', found 'int'");
    EXPECT_EQ(
        common::composeMessage(Value(5), Value_type::object, L"parsing json vector.").message.ansi_str(),
        "Encounterd 'object', found 'int. While parsing json vector.'");
}

TEST(UntranslatedMessage, IsThatOfAnExtractedError)
{
    char const* const english = "Attempting to get the value of an Expected type that contains an error.";
    Translation const translation{{english, "Kein Wert"}};
    EXPECT_EQ(
        thrownBy([] {
            static_cast<void>(Expected<OdString>(ErrorMessage(L"disk full")).visit(GetRValueOrThrow<OdString>{}));
        }),
        english);
}

TEST(UntranslatedMessage, IsWhatAnErrorMessageIsBuiltFrom)
{
    Translation const translation{{"unsupported file change", "unbekannt"}, {"Could not find %ls", "%ls fehlt"}};
    EXPECT_EQ(ErrorMessage(L"unsupported file change").message, OdString(L"unsupported file change"));
    EXPECT_EQ(ErrorMessage(L"Could not find %ls", L"plan.dwg").message, OdString(L"Could not find plan.dwg"));
}

TEST(UntranslatedMessage, IsThatOfAnIgnoreFileThatCannotBeWritten)
{
    TempFolder const folder;
    Translation const translation{{"Failed to write Ignore file.", "Nicht geschrieben"}};
    EXPECT_EQ(errorOf(common::RepoIgnore::write(RootPath(folder.widePath()))), "Failed to write Ignore file.");
}

TEST(UntranslatedText, IsAFileChangeInADocument)
{
    Translation const translation{{"added", "neu"}};
    EXPECT_EQ(common::toString(FileChange::added).value(), OdString(L"added"));
    EXPECT_EQ(common::toFileChange(L"added").value(), FileChange::added);
    EXPECT_FALSE(common::toFileChange(L"neu").hasValue());
}

} // namespace
