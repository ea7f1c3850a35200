#include "tests/config/configurations.h"

#include "tests/support/allocations.h"
#include "tests/support/recording_io.h"

#include <array>
#include <csignal>
#include <functional>
#include <gmock/gmock.h>
#include <memory>
#include <stdexcept>

namespace {

using namespace configurations;
using common::Config;
using common::ConfigData;
using common::ConfigListener;
using common::ConfigListeners;
using common::ConfigPath;
using common::ListenerOrder;
using common::WriteConfigData;
using support::RecordingIo;
using testing::ElementsAre;
using testing::IsEmpty;

/// Writes its number down when it is told, then does what the test wants.
class Listener final : public ConfigListener {
public:
    void configChanged() override
    {
        told->push_back(number);
        if (then) {
            then();
        }
    }

    std::vector<int>* told = nullptr;
    int number = 0;
    std::function<void()> then;
};

/// Four listeners, numbered by ascending addresses. The configuration is saved nowhere.
class Listeners : public testing::Test {
protected:
    Listeners()
    {
        for (std::size_t i = 0; i < listeners.size(); ++i) {
            listeners[i].told = &told;
            listeners[i].number = static_cast<int>(i);
        }
    }

    void add(std::initializer_list<std::size_t> numbers)
    {
        for (std::size_t const number : numbers) {
            config.addListener(listeners[number]);
        }
    }

    std::vector<int> toldOnWriting()
    {
        told.clear();
        config.write();
        return told;
    }

    support::TempFolder const folder;
    RecordingIo const io;
    Config config{ConfigPath(folder.widePath()), io};
    std::vector<int> told;
    std::array<Listener, 4> listeners;
};

TEST_F(Listeners, AreToldInAscendingOrderOfAddresses)
{
    add({2, 0, 3, 1});
    EXPECT_THAT(toldOnWriting(), ElementsAre(0, 1, 2, 3));
}

TEST_F(Listeners, AreToldOnceHoweverOftenTheyAreAdded)
{
    add({1, 0, 1, 1});
    EXPECT_THAT(toldOnWriting(), ElementsAre(0, 1));
    config.removeListener(listeners[1]);
    EXPECT_THAT(toldOnWriting(), ElementsAre(0));
}

TEST_F(Listeners, AreToldWhenTheWriterGoes)
{
    add({0});
    {
        WriteConfigData const writer = config.write();
        writer->add(L"/a", L"A", L"1");
        EXPECT_THAT(told, IsEmpty());
    }
    EXPECT_THAT(told, ElementsAre(0));
}

TEST_F(Listeners, SeeWhatWasWritten)
{
    std::string seen;
    listeners[0].then = [&] { seen = inWords(config.read()); };
    add({0});
    config.write()->add(L"/a", L"A", L"1");
    EXPECT_EQ(seen, "/a = A (1)");
}

TEST_F(Listeners, AreToldOfEveryWriter)
{
    add({0});
    {
        WriteConfigData const first = config.write();
        WriteConfigData const second = config.write();
    }
    EXPECT_THAT(told, ElementsAre(0, 0));
}

TEST_F(Listeners, AreNotToldOfReading)
{
    add({0});
    static_cast<void>(config.read());
    EXPECT_THAT(told, IsEmpty());
}

TEST_F(Listeners, AreNotToldWhenTheyHaveBeenRemoved)
{
    add({0, 1, 2});
    config.removeListener(listeners[1]);
    EXPECT_THAT(toldOnWriting(), ElementsAre(0, 2));
}

TEST_F(Listeners, MayBeRemovedWithoutBeingThere)
{
    add({0});
    config.removeListener(listeners[1]);
    EXPECT_THAT(toldOnWriting(), ElementsAre(0));
}

TEST_F(Listeners, MayComeBack)
{
    add({0, 1});
    config.removeListener(listeners[0]);
    add({0});
    EXPECT_THAT(toldOnWriting(), ElementsAre(0, 1));
}

TEST_F(Listeners, MayRemoveThemselvesWhileTold)
{
    add({0, 1, 2});
    listeners[1].then = [&] { config.removeListener(listeners[1]); };
    EXPECT_THAT(toldOnWriting(), ElementsAre(0, 1, 2));
    EXPECT_THAT(toldOnWriting(), ElementsAre(0, 2));
}

TEST_F(Listeners, AreNotToldWhenAnotherOneHasRemovedThem)
{
    add({0, 1, 2, 3});
    listeners[1].then = [&] {
        config.removeListener(listeners[0]);
        config.removeListener(listeners[2]);
    };
    EXPECT_THAT(toldOnWriting(), ElementsAre(0, 1, 3));
    EXPECT_THAT(toldOnWriting(), ElementsAre(1, 3));
}

TEST_F(Listeners, AreToldWhenAddedWhileEarlierOnesAreTold)
{
    add({1});
    listeners[1].then = [&] { add({0, 2}); };
    EXPECT_THAT(toldOnWriting(), ElementsAre(1, 2));
    EXPECT_THAT(toldOnWriting(), ElementsAre(0, 1, 2));
}

TEST_F(Listeners, AreToldWhenThereIsNoMemory)
{
    add({0, 1, 2});
    told.reserve(listeners.size());
    {
        support::RefusedAllocations const refused(0);
        config.write();
    }
    EXPECT_THAT(told, ElementsAre(0, 1, 2));
}

TEST_F(Listeners, AreAllToldBeforeAConfigurationGoesWhoseLastOwnerOneOfThemReleases)
{
    auto shared = std::make_shared<Config>(ConfigPath(folder.widePath()), io);
    listeners[0].then = [&] { shared.reset(); };
    listeners[1].then = [&] { EXPECT_THAT(io.calls(), IsEmpty()); };
    shared->addListener(listeners[0]);
    shared->addListener(listeners[1]);
    shared->write()->add(L"/a", L"A", L"1");
    EXPECT_THAT(told, ElementsAre(0, 1));
    EXPECT_THAT(io.calls(), ElementsAre("report success"));
    EXPECT_EQ(loaded(folder.widePath(), io), "/a = A (1)");
}

TEST_F(Listeners, EndTheProcessByThrowing)
{
    add({0});
    listeners[0].then = [] { throw std::runtime_error("a listener throws"); };
    EXPECT_EXIT(config.write(), testing::KilledBySignal(SIGABRT), "a listener throws");
}

TEST(ListenerOrder, IsThatOfTheAddresses)
{
    std::array<Listener, 2> listeners;
    ListenerOrder const before;
    EXPECT_TRUE(before(listeners[0], listeners[1]));
    EXPECT_FALSE(before(listeners[1], listeners[0]));
    EXPECT_FALSE(before(listeners[0], listeners[0]));
}

TEST(WriteConfigData, GivesAccessToTheDataItIsMadeOf)
{
    ConfigData data;
    ConfigListeners listeners;
    std::vector<int> told;
    Listener listener;
    listener.told = &told;
    listeners.insert(listener);
    {
        WriteConfigData const writer(data, listeners);
        EXPECT_EQ(&*writer, &data);
        EXPECT_EQ(writer.operator->(), &data);
        (*writer).add(L"/a", L"A", L"1");
    }
    EXPECT_EQ(inWords(data), "/a = A (1)");
    EXPECT_THAT(told, ElementsAre(0));
}

} // namespace
