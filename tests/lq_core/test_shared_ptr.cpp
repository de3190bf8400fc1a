#include <gtest/gtest.h>

#include <regex>
#include <sstream>
#include <string>
#include <type_traits>

#include "LQ_History.h"
#include "LQ_SharedPtr.h"
#include "LQ_Time.h"
#include "LogCapture.h"

using namespace LQ;

namespace {
// Counts destructions so a test sees exactly when a holder deletes.
struct Tracked {
    static int destroyed;
    int value = 0;
    Tracked() = default;
    explicit Tracked(int v) : value(v) {}
    virtual ~Tracked() { ++destroyed; }
};
int Tracked::destroyed = 0;

struct DerivedTracked : Tracked {
    static int derivedDestroyed;
    explicit DerivedTracked(int v) : Tracked(v) {}
    ~DerivedTracked() override { ++derivedDestroyed; }
};
int DerivedTracked::derivedDestroyed = 0;

using TrackedBase = SharedPtrBase<Tracked, DefaultPtrDeleter<Tracked>>;

template <class T>
std::string printed(const T& value) {
    std::ostringstream stream;
    stream << value;
    return stream.str();
}
}  // namespace

TEST(SharedPtr, ownershipAndRelease) {
    Tracked::destroyed = 0;
    {
        SharedPtr<Tracked> first(new Tracked(1));
        SharedPtr<Tracked> second(first);
        EXPECT_EQ(first.useCount(), 2);

        // the copy keeps the object alive after the first holder moves on
        first = new Tracked(2);
        EXPECT_EQ(Tracked::destroyed, 0);
        EXPECT_EQ(second->value, 1);

        // a raw assignment to the only holder destroys what it held
        second = new Tracked(3);
        EXPECT_EQ(Tracked::destroyed, 1);
        EXPECT_EQ((*second).value, 3);

        // assigning null takes ownership of nothing and still releases
        second = static_cast<Tracked*>(nullptr);
        EXPECT_EQ(Tracked::destroyed, 2);
        EXPECT_FALSE(second);

        // a holder assigned to another sharing the same object keeps it alive
        SharedPtr<Tracked> third(first);
        first = third;
        EXPECT_EQ(Tracked::destroyed, 2);
        EXPECT_EQ(first.useCount(), 2);

        // self-assignment of the only owner neither deletes nor changes the count
        SharedPtr<Tracked> sole(new Tracked(4));
        SharedPtr<Tracked>& alias = sole;
        sole = alias;
        EXPECT_EQ(Tracked::destroyed, 2);
        EXPECT_EQ(sole.useCount(), 1);
        EXPECT_EQ(sole->value, 4);
    }
    EXPECT_EQ(Tracked::destroyed, 4);

    EXPECT_EQ(printed(SharedPtr<int>(new int(5))), "SharedPtr(5)");
    EXPECT_EQ(printed(SharedPtr<int>()), "SharedPtr(NULL)");
}

TEST(SharedPtr, nonOwningHolderNeverDeletes) {
    Tracked::destroyed = 0;
    const int before = TrackedBase::staticCounter_.load();
    Tracked local(7);
    {
        SharedPtr<Tracked> view(&local, false);
        SharedPtr<Tracked> copy(view);
        EXPECT_FALSE(copy.isOwning());
        EXPECT_EQ(copy->value, 7);
        EXPECT_EQ(TrackedBase::staticCounter_.load(), before + 2);
    }
    EXPECT_EQ(Tracked::destroyed, 0);
    EXPECT_EQ(TrackedBase::staticCounter_.load(), before);
    // the owning form of the same constructor does delete
    { SharedPtr<Tracked> owner(new Tracked(8), true); }
    EXPECT_EQ(Tracked::destroyed, 1);
}

TEST(SharedPtr, derivedSharedAsBase) {
    Tracked::destroyed = 0;
    DerivedTracked::derivedDestroyed = 0;
    {
        SharedPtr<Tracked> base;
        {
            SharedPtr<DerivedTracked> derived(new DerivedTracked(5));
            base = derived;
            EXPECT_EQ(derived.useCount(), 2);
            SharedPtr<Tracked> constructed(derived);
            EXPECT_EQ(derived.useCount(), 3);
        }
        EXPECT_EQ(Tracked::destroyed, 0);
        EXPECT_EQ(base->value, 5);
    }
    // deleted once, through the virtual destructor
    EXPECT_EQ(DerivedTracked::derivedDestroyed, 1);
    EXPECT_EQ(Tracked::destroyed, 1);

    // a non-owning derived holder stays non-owning as its base
    DerivedTracked local(6);
    {
        SharedPtr<DerivedTracked> view(&local, false);
        SharedPtr<Tracked> base(view);
        EXPECT_FALSE(base.isOwning());
    }
    EXPECT_EQ(DerivedTracked::derivedDestroyed, 1);
}

TEST(SharedPtr, arrayDeletesEveryElement) {
    Tracked::destroyed = 0;
    {
        SharedArray<Tracked> array(new Tracked[3]);
        SharedArray<Tracked> copy(array);
        copy[2].value = 9;
        EXPECT_EQ(array[2].value, 9);
        array = new Tracked[2];
        EXPECT_EQ(Tracked::destroyed, 0);
    }
    EXPECT_EQ(Tracked::destroyed, 5);

    // a non-owning array over the stack: a delete[] here would crash
    int buffer[4] = {1, 2, 3, 4};
    { EXPECT_EQ(SharedArray<int>(buffer, false)[3], 4); }
}

TEST(History, ringOfLastValues) {
    History<int> history;
    history.init(3);
    for (int value = 1; value <= 4; ++value) history.add(value);
    EXPECT_EQ(history.size(), 3u);
    EXPECT_EQ(history.element(0), 4);
    EXPECT_EQ(history.element(2), 2);

    const FailedCheck outside = catchCheck([&] { history.element(3); });
    EXPECT_EQ(outside.expression, "number < size()");
    EXPECT_EQ(outside.tail, "accessing of element out of range : 3 >= 3");
    EXPECT_EQ(outside.function, "element");

    // the next slot still holds what the previous pass left: the 2 that just fell out
    int& slot = history.modifyNext();
    EXPECT_EQ(slot, 2);
    slot = 5;
    EXPECT_EQ(history.element(0), 5);
    EXPECT_EQ(history.element(2), 3);
    EXPECT_EQ(history.counter(), 5u);

    History<bool> flags;
    flags.init(4);
    EXPECT_EQ(printed(flags), "History[0]()");
    flags.add(true);
    flags.add(false);
    EXPECT_EQ(printed(flags), "History[2](0, 1, )");
}

TEST(History, initKeepsDropsOrIsMissing) {
    History<int> history;
    history.init(5);
    history.add(1);
    history.add(2);
    history.init(5);
    EXPECT_EQ(history.size(), 2u);
    EXPECT_EQ(history.element(0), 2);
    history.init(4);
    EXPECT_EQ(history.size(), 0u);
    EXPECT_EQ(history.capacity(), 4u);

    // a copy owns its own values
    history.add(7);
    History<int> copy(history);
    history.add(8);
    EXPECT_EQ(copy.size(), 1u);
    EXPECT_EQ(copy.element(0), 7);

    // before init and after free, add refuses
    History<float> floats;
    for (int round = 0; round < 2; ++round) {
        const FailedCheck check = catchCheck([&] { floats.add(1.f); });
        EXPECT_EQ(check.expression, "data_");
        EXPECT_EQ(check.tail, "init not called\n");
        EXPECT_EQ(check.function, "add");
        floats.init(2);
        floats.add(1.f);
        floats.free();
        EXPECT_EQ(floats.size(), 0u);
    }
}

TEST(Time, clockReadingsAndForms) {
    const unsigned long before = getTimeNano();
    const long milliseconds = getTime();
    const unsigned long after = getTimeNano();
    EXPECT_GE(milliseconds, static_cast<long>(before / 1000000));
    EXPECT_LE(milliseconds, static_cast<long>(after / 1000000));

    // the clock can be set back, so a difference must be able to go below zero
    Timer timer;
    static_assert(std::is_signed<decltype(timer.getDiff())>::value, "signed difference");
    static_assert(std::is_signed<decltype(timer.getDiffNano())>::value, "signed difference");
    EXPECT_GE(timer.getDiffNano(), 0);

    const std::string text = printed(timer);
    std::smatch match;
    ASSERT_TRUE(std::regex_match(text, match, std::regex("(-?[0-9]+)ms")));
    const long shown = std::stol(match[1]);
    EXPECT_GE(shown, 0);
    EXPECT_LE(shown, timer.getDiff());

    EXPECT_TRUE(
        std::regex_match(expandedTime(1700000000, 5000), std::regex("[0-9]{2}:[0-9]{2}:[0-9]{2}\\.000005")));
    EXPECT_TRUE(std::regex_match(expandedTime(), std::regex("[0-9]{2}:[0-9]{2}:[0-9]{2}\\.[0-9]{6}")));
    EXPECT_TRUE(
        std::regex_match(fullTime(), std::regex("[0-9]{4}_[0-9]{2}_[0-9]{2}__[0-9]{2}_[0-9]{2}_[0-9]{2}")));
    EXPECT_TRUE(std::regex_match(fullDate(), std::regex("[0-9]{4}_[0-9]{2}_[0-9]{2}")));
}
