// Interface queries, late-bound calls with by-reference arguments, and the
// error source that accumulates a call stack.
#include <gtest/gtest.h>

#include "platform/automation/error.h"
#include "platform/automation/object.h"
#include "platform/automation/variant.h"

namespace {

class IGreeter : public virtual pelta::Object {
public:
    virtual std::string greet(const std::string& who) = 0;
};
class ICounter : public virtual pelta::Object {
public:
    virtual int next() = 0;
};

class Both final : public IGreeter, public ICounter {
public:
    std::string greet(const std::string& who) override { return "Здравей, " + who; }
    int next() override { return ++n_; }
    pelta::Variant invoke(std::string_view member, pelta::CallKind kind,
                          std::span<pelta::Variant> args) override {
        if (pelta::memberIs(member, "Swap") && args.size() == 2) {
            args[0].swap(args[1]);
            return true;
        }
        if (pelta::memberIs(member, "Greet") && args.size() == 1) return greet(args[0].toString());
        return Object::invoke(member, kind, args);
    }

private:
    int n_ = 0;
};

class OnlyGreeter final : public IGreeter {
public:
    std::string greet(const std::string&) override { return {}; }
};

TEST(Object, InterfaceQueryAndSharedReferenceCount) {
    auto live = pelta::Object::liveObjects();
    {
        pelta::Ref<Both> both = pelta::makeRef<Both>();
        pelta::ObjectRef asObject = both;
        EXPECT_EQ(both->refCount(), 2);
        pelta::Ref<ICounter> counter = pelta::queryRef<ICounter>(asObject);
        ASSERT_TRUE(counter);
        EXPECT_EQ(counter->next(), 1);
        EXPECT_EQ(both->refCount(), 3);  // one count for all interfaces
        // From one interface to another.
        auto* greeter = pelta::query<IGreeter>(counter.get());
        ASSERT_NE(greeter, nullptr);
        EXPECT_EQ(greeter->greet("Иван"), "Здравей, Иван");

        pelta::ObjectRef only = pelta::makeRef<OnlyGreeter>();
        EXPECT_TRUE(pelta::implements<IGreeter>(only.get()));
        EXPECT_FALSE(pelta::implements<ICounter>(only.get()));
        EXPECT_EQ(pelta::Object::liveObjects(), live + 2);
    }
    EXPECT_EQ(pelta::Object::liveObjects(), live);
}

TEST(Object, LateBoundCallsWriteBackByReferenceArguments) {
    pelta::ObjectRef o = pelta::makeRef<Both>();
    pelta::Variant args[2] = {pelta::Variant("a"), pelta::Variant(int32_t{7})};
    EXPECT_TRUE(pelta::callByName(o.get(), "SWAP", args).toBool());
    EXPECT_EQ(args[0], pelta::Variant(int32_t{7}));
    EXPECT_EQ(args[1], pelta::Variant("a"));

    pelta::Variant who("Мария");
    EXPECT_EQ(pelta::callByName(o.get(), "greet", std::span(&who, 1)).toString(), "Здравей, Мария");

    try {
        pelta::callByName(o.get(), "NoSuchMember");
        FAIL();
    } catch (const pelta::Error& e) {
        EXPECT_EQ(e.number(), pelta::errc::NotSupported);
    }
    EXPECT_THROW(pelta::callByName(nullptr, "Greet"), pelta::Error);
}

TEST(Error, SourceAccumulatesOutermostFirstKeepingNumberAndDescription) {
    auto inner = [] { pelta::raise(1234, "Pelta: Нещо се обърка", "Inner"); };
    auto middle = [&] {
        try {
            inner();
        } catch (const pelta::Error& e) {
            throw e.withLocation("Middle");
        }
    };
    try {
        try {
            middle();
        } catch (const pelta::Error& e) {
            throw e.withLocation("Outer");
        }
    } catch (const pelta::Error& e) {
        EXPECT_EQ(e.number(), 1234);
        EXPECT_EQ(e.description(), "Pelta: Нещо се обърка");
        EXPECT_EQ(e.source(), "Outer\nMiddle\nInner");
    }
    pelta::Error blank(pelta::errc::TypeMismatch, {}, "x");
    EXPECT_EQ(blank.withLocation("Here").source(), "Here");
}

}  // namespace
