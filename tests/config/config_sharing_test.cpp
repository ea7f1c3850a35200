#include "tests/config/configurations.h"

#include "tests/support/recording_io.h"
#include "tests/support/utf8.h"

#include <gmock/gmock.h>
#include <type_traits>

namespace {

using namespace configurations;
using common::Config;
using common::ConfigData;
using common::ConfigPath;
using support::RecordingIo;
using support::TempFolder;
using testing::ElementsAre;
using testing::IsEmpty;

static_assert(!std::is_copy_constructible_v<Config> && !std::is_copy_assignable_v<Config>);

std::string const kHouse = R"({"projects_map": [{"info": {"name": "House", "uid": "1"}, "path": "/house"}]})";
std::string const kBridge = R"({"projects_map": [{"info": {"name": "Bridge", "uid": "2"}, "path": "/bridge"}]})";

class SharedConfig : public testing::Test {
protected:
    SharedConfig() { folder.write(kFile, kHouse); }

    TempFolder const folder;
    RecordingIo const io;
};

TEST_F(SharedConfig, IsOneWhileItLives)
{
    ConfigRef const first = load(folder.widePath(), io);
    ConfigRef const second = load(folder.widePath(), io);
    EXPECT_EQ(first, second);
    second->write()->add(L"/new", L"New", L"3");
    EXPECT_EQ(inWords(first->read()), "/house = House (1), /new = New (3)");
}

TEST_F(SharedConfig, KeepsWhatIsInMemoryWhenTheFileHasChanged)
{
    ConfigRef const first = load(folder.widePath(), io);
    folder.write(kFile, kBridge);
    EXPECT_EQ(load(folder.widePath(), io), first);
    EXPECT_EQ(inWords(first->read()), "/house = House (1)");
}

TEST_F(SharedConfig, DoesNotHideAFileThatHasBecomeBad)
{
    ConfigRef const first = load(folder.widePath(), io);
    folder.write(kFile, "[]");
    EXPECT_EQ(loaded(folder.widePath(), io), "error: Error:\tExpected json type 'object', found 'array'");
    folder.write(kFile, kHouse);
    EXPECT_EQ(load(folder.widePath(), io), first);
}

TEST_F(SharedConfig, IsNotFoundWithoutItsFile)
{
    ConfigRef const first = load(folder.widePath(), io);
    ASSERT_EQ(std::remove(folder.pathTo(kFile).c_str()), 0);
    ConfigRef const second = load(folder.widePath(), io);
    EXPECT_NE(first, second);
    EXPECT_EQ(inWords(second->read()), "no projects");
}

TEST_F(SharedConfig, IsReadAnewWhenTheLastOwnerHasLetGo)
{
    load(folder.widePath(), io);
    folder.write(kFile, kBridge);
    EXPECT_EQ(loaded(folder.widePath(), io), "/bridge = Bridge (2)");
    EXPECT_EQ(loaded(folder.widePath(), io), "/bridge = Bridge (2)");
}

TEST_F(SharedConfig, ReportsToTheHostThatLoadedItFirst)
{
    RecordingIo const second;
    {
        ConfigRef const first = load(folder.widePath(), io);
        load(folder.widePath(), second)->write();
    }
    EXPECT_THAT(io.calls(), ElementsAre("report success"));
    EXPECT_THAT(second.calls(), IsEmpty());
}

TEST_F(SharedConfig, IsAnotherOneForAnotherSpellingOfTheFolder)
{
    folder.makeLink("link", folder.path());
    std::vector<ConfigRef> configs;
    for (std::string const& path :
         {folder.path(), folder.path() + "/", folder.path() + "//", folder.path() + "/.", folder.pathTo("link")}) {
        configs.push_back(load(support::fromUtf8(path), io));
        EXPECT_EQ(configs.back(), load(support::fromUtf8(path), io));
        EXPECT_EQ(configs.back()->path().path(), support::fromUtf8(path));
    }
    EXPECT_EQ(std::set<ConfigRef>(configs.begin(), configs.end()).size(), configs.size());
}

TEST_F(SharedConfig, IsLeftAsItWasByReading)
{
    {
        ConfigRef const config = load(folder.widePath(), io);
        EXPECT_EQ(inWords(config->read()), "/house = House (1)");
    }
    EXPECT_EQ(folder.read(kFile), kHouse);
    EXPECT_THAT(folder.list(), ElementsAre(kFile));
    EXPECT_THAT(io.calls(), IsEmpty());
}

TEST_F(SharedConfig, IsForgottenOnDemandAndLivesOn)
{
    ConfigRef const first = load(folder.widePath(), io);
    Config::factory().erase(first->path());
    ConfigRef const second = load(folder.widePath(), io);
    EXPECT_NE(first, second);
    EXPECT_EQ(inWords(first->read()), "/house = House (1)");
    EXPECT_EQ(load(folder.widePath(), io), second);
}

TEST_F(SharedConfig, ComesFromTheFactoryOfTheProcess)
{
    ConfigRef const config = load(folder.widePath(), io);
    EXPECT_EQ(Config::factory().get(config->path(), ConfigData(), io), config);
    EXPECT_EQ(&Config::factory(), &Config::factory());
}

TEST(ConfigWithoutFile, IsAnotherOneForEveryCaller)
{
    TempFolder const folder;
    RecordingIo const io;
    ConfigRef const first = load(folder.widePath(), io);
    ConfigRef const second = load(folder.widePath(), io);
    EXPECT_NE(first, second);
    first->write()->add(L"/new", L"New", L"3");
    EXPECT_EQ(inWords(second->read()), "no projects");
    EXPECT_NE(Config::factory().get(first->path(), ConfigData(), io), first);
}

TEST(ConfigWithoutFile, StaysUnsharedWhenTheFileHasCome)
{
    TempFolder const folder;
    RecordingIo const io;
    ConfigRef const before = load(folder.widePath(), io);
    folder.write(kFile, kHouse);
    ConfigRef const after = load(folder.widePath(), io);
    EXPECT_NE(before, after);
    EXPECT_EQ(inWords(before->read()), "no projects");
    EXPECT_EQ(inWords(after->read()), "/house = House (1)");
}

ConfigData dataOf(wchar_t const* path)
{
    ConfigData data;
    data.add(path, L"Name", L"1");
    return data;
}

TEST(ConfigFactory, DropsDataAndHostForALivingConfiguration)
{
    TempFolder const folder;
    RecordingIo const io;
    RecordingIo const other;
    Config::Factory factory;
    {
        ConfigRef const first = factory.get(ConfigPath(folder.widePath()), dataOf(L"/a"), io);
        EXPECT_EQ(factory.get(ConfigPath(folder.widePath()), dataOf(L"/b"), other), first);
        EXPECT_EQ(inWords(first->read()), "/a = Name (1)");
        first->write();
    }
    EXPECT_THAT(io.calls(), ElementsAre("report success"));
    EXPECT_THAT(other.calls(), IsEmpty());
}

TEST(ConfigFactory, ReplacesOneThatHasGone)
{
    RecordingIo const io;
    Config::Factory factory;
    ConfigPath const path(L"a");
    factory.get(path, dataOf(L"/a"), io);
    ConfigRef const second = factory.get(path, dataOf(L"/b"), io);
    EXPECT_EQ(inWords(second->read()), "/b = Name (1)");
    EXPECT_EQ(factory.get(path, dataOf(L"/c"), io), second);
}

TEST(ConfigFactory, KeepsNothingAlive)
{
    RecordingIo const io;
    Config::Factory factory;
    std::weak_ptr<Config> const config = factory.get(ConfigPath(L"a"), ConfigData(), io);
    EXPECT_TRUE(config.expired());
}

TEST(ConfigFactory, TellsFoldersApartByTheirSpelling)
{
    RecordingIo const io;
    Config::Factory factory;
    ConfigRef const plain = factory.get(ConfigPath(L"a"), ConfigData(), io);
    EXPECT_NE(factory.get(ConfigPath(L"a/"), ConfigData(), io), plain);
    EXPECT_NE(factory.get(ConfigPath(L"A"), ConfigData(), io), plain);
    EXPECT_EQ(factory.get(ConfigPath(L"a"), ConfigData(), io), plain);
}

TEST(ConfigFactory, DoesNotKnowTheConfigurationsOfAnother)
{
    RecordingIo const io;
    Config::Factory first;
    Config::Factory second;
    ConfigRef const config = first.get(ConfigPath(L"a"), ConfigData(), io);
    EXPECT_NE(second.get(ConfigPath(L"a"), ConfigData(), io), config);
}

TEST(ConfigFactory, ForgetsOneFolder)
{
    RecordingIo const io;
    Config::Factory factory;
    ConfigRef const a = factory.get(ConfigPath(L"a"), ConfigData(), io);
    ConfigRef const b = factory.get(ConfigPath(L"b"), ConfigData(), io);
    factory.erase(ConfigPath(L"a"));
    factory.erase(ConfigPath(L"unknown"));
    EXPECT_NE(factory.get(ConfigPath(L"a"), ConfigData(), io), a);
    EXPECT_EQ(factory.get(ConfigPath(L"b"), ConfigData(), io), b);
}

TEST(Config, StartsWithTheDataThatItIsGiven)
{
    RecordingIo const io;
    EXPECT_EQ(inWords(Config(ConfigPath(L"a"), dataOf(L"/a"), io).read()), "/a = Name (1)");
    EXPECT_EQ(inWords(Config(ConfigPath(L"a"), io).read()), "no projects");
    EXPECT_EQ(Config(ConfigPath(L"a/"), io).path().path(), OdString(L"a/"));
    EXPECT_THAT(io.calls(), IsEmpty());
}

TEST(ConfigData, ReplacesBothFieldsOfAProjectThatIsThere)
{
    ConfigData data;
    data.add(L"/a", L"A", L"1");
    data.add(L"/b", L"B", L"2");
    data.add(L"/a", L"C", L"");
    EXPECT_EQ(inWords(data), "/a = C (), /b = B (2)");
}

TEST(ConfigData, DropsOnlyTheProjectThatIsNamed)
{
    ConfigData data = dataOf(L"/a");
    data.remove(L"/A");
    data.remove(L"/a/");
    EXPECT_EQ(inWords(data), "/a = Name (1)");
    data.remove(L"/a");
    data.remove(L"/a");
    EXPECT_EQ(inWords(data), "no projects");
}

} // namespace
