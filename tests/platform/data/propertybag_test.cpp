#include "platform/data/propertybag.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>

#include "platform/automation/error.h"
#include "platform/data/variant_bytes.h"

namespace pelta {
namespace {

// Decoding must fail with InvalidData naming a byte position.
void expectInvalid(std::span<const uint8_t> bytes, std::string_view mentions = {}) {
    try {
        PropertyBag::fromContents(bytes);
        ADD_FAILURE() << "decoded " << bytes.size() << " malformed bytes";
    } catch (const Error& e) {
        EXPECT_EQ(e.number(), errc::InvalidData) << e.description();
        EXPECT_NE(e.description().find("at byte "), std::string::npos) << e.description();
        if (!mentions.empty()) {
            EXPECT_NE(e.description().find(mentions), std::string::npos) << e.description();
        }
    }
}

Bytes header(uint64_t count) {
    Bytes b{'P', 'B', 'A', 'G', 1};
    ByteWriter(b).varint(count);
    return b;
}

// An object kind for tests: a text that persists itself.
class Note : public virtual Persistable {
public:
    Note(std::string tag, std::string text) : tag_(std::move(tag)), text_(std::move(text)) {}
    std::string_view persistTag() const override { return tag_; }
    void persist(ByteWriter& w) const override { w.str(text_); }
    const std::string& text() const { return text_; }

private:
    std::string tag_;
    std::string text_;
};

class Plain : public virtual Object {};

TEST(PropertyBagTest, EveryKindRoundTripsWithItsKindAndValue) {
    const Decimal price = Decimal::fromParts(0x0123456789ABCDEFull, 0x00FEDCBA, 17, true);
    const std::vector<std::pair<std::string, Variant>> values = {
        {"Empty", Variant()},
        {"Null", Variant::null()},
        {"Missing", Variant::missing()},
        {"True", Variant(true)},
        {"False", Variant(false)},
        {"Byte", Variant::byte(255)},
        {"Integer", Variant::integer(-32768)},
        {"Long", Variant(std::numeric_limits<int32_t>::min())},
        {"Double", Variant(-1.25e-300)},
        {"NegativeZero", Variant(-0.0)},
        {"Currency", Variant(Currency{std::numeric_limits<int64_t>::min()})},
        {"Decimal", Variant(price)},
        {"DecimalZeroScale", Variant(Decimal::fromParts(7, 0, 0, false))},
        {"DecimalTrailingZeros", Variant(Decimal::fromParts(150, 0, 2, false))},
        {"Date", Variant(Date{45351.573})},
        {"FirstDate", Variant(Date{-657434.0})},
        {"Name", Variant("Цена на дребно „Ябълки“ 🍎")},
        {"EmptyText", Variant("")},
        {"Error", Variant::error(-2147352572)},
        {"Bytes", Variant(Bytes{0, 1, 0x7F, 0x80, 0xFF})},
        {"NoBytes", Variant(Bytes{})},
        {"Nothing", Variant::nothing()},
        {"Array",
         Variant(std::vector<Variant>{
             Variant(1), Variant("две"), Variant::null(),
             Variant(std::vector<Variant>{Variant(Bytes{9}), Variant(std::vector<Variant>{})})})},
    };
    PropertyBag bag;
    for (const auto& [name, value] : values)
        bag.writeProperty(name, value);
    auto loaded = PropertyBag::fromContents(bag.contents());

    ASSERT_EQ(loaded->names(), bag.names());
    for (const auto& [name, value] : values) {
        Variant got = loaded->readProperty(name);
        EXPECT_EQ(got.type(), value.type()) << name;
        EXPECT_TRUE(got == value) << name;
    }
    // The sign of zero and the scale of the decimal survive, not only the value.
    EXPECT_TRUE(std::signbit(loaded->readProperty("NegativeZero").rawDouble()));
    const Decimal d = loaded->readProperty("Decimal").rawDecimal();
    EXPECT_EQ(d.lo(), price.lo());
    EXPECT_EQ(d.hi(), price.hi());
    EXPECT_EQ(d.scale(), 17);
    EXPECT_TRUE(d.negative());
    EXPECT_EQ(loaded->readProperty("DecimalTrailingZeros").rawDecimal().scale(), 2);
    // Empty text, Empty and Null stay three different things.
    EXPECT_TRUE(loaded->readProperty("EmptyText").isString());
    EXPECT_TRUE(loaded->readProperty("Empty").isEmpty());
    EXPECT_TRUE(loaded->readProperty("Null").isNull());
    EXPECT_TRUE(loaded->hasProperty("Empty"));
    // Encoding is deterministic.
    EXPECT_EQ(loaded->contents(), bag.contents());
}

TEST(PropertyBagTest, ByteFormIsStable) {
    PropertyBag bag;
    bag.writeProperty("ID", Variant(5));
    bag.writeProperty("Ok", Variant(true));
    const Bytes expected{'P', 'B', 'A', 'G', 1, 2, 2, 'I', 'D', 6, 5, 0, 0, 0, 2, 'O', 'k', 3, 1};
    EXPECT_EQ(bag.contents(), expected);
    EXPECT_EQ(PropertyBag().contents(), (Bytes{'P', 'B', 'A', 'G', 1, 0}));
}

TEST(PropertyBagTest, BagsNestThreeLevelsDeep) {
    auto inner = makeRef<PropertyBag>();
    inner->writeProperty("Code", Variant("ВЪТРЕШЕН"));
    inner->writeProperty("Amount", Variant(Decimal::fromParts(12345, 0, 3, true)));
    auto middle = makeRef<PropertyBag>();
    middle->writeProperty("Inner", Variant(inner));
    middle->writeProperty("List",
                          Variant(std::vector<Variant>{Variant(inner), Variant::nothing()}));
    PropertyBag outer;
    outer.writeProperty("Middle", Variant(middle));
    outer.writeProperty("After", Variant(7));

    auto loaded = PropertyBag::fromContents(outer.contents());
    Variant m = loaded->readProperty("Middle");
    ASSERT_TRUE(m.isObject());
    EXPECT_EQ(typeName(m), "PropertyBag");
    auto* mid = query<PropertyBag>(m.object());
    ASSERT_NE(mid, nullptr);
    auto* in = query<PropertyBag>(mid->readProperty("Inner").object());
    ASSERT_NE(in, nullptr);
    EXPECT_EQ(in->readProperty("Code").str(), "ВЪТРЕШЕН");
    EXPECT_TRUE(in->readProperty("Amount") == Variant(Decimal::fromParts(12345, 0, 3, true)));
    const Variant listValue = mid->readProperty("List");
    const auto& list = listValue.array();
    ASSERT_EQ(list.size(), 2u);
    EXPECT_NE(query<PropertyBag>(list[0].object()), nullptr);
    EXPECT_TRUE(list[1].isNothing());
    EXPECT_TRUE(loaded->readProperty("After") == Variant(7));
    EXPECT_EQ(loaded->contents(), outer.contents());
}

TEST(PropertyBagTest, MissingPropertiesReadAsEmptyOrTheDefault) {
    PropertyBag bag;
    bag.writeProperty("Present", Variant::null());
    EXPECT_TRUE(bag.readProperty("Absent").isEmpty());
    EXPECT_TRUE(bag.readProperty("Absent", Variant("по подразбиране")) ==
                Variant("по подразбиране"));
    EXPECT_FALSE(bag.hasProperty("Absent"));
    // A present Null is not replaced by the default.
    EXPECT_TRUE(bag.readProperty("Present", Variant(1)).isNull());
}

TEST(PropertyBagTest, NamesIgnoreAsciiCaseAndOverwritingKeepsFirstOrderAndSpelling) {
    PropertyBag bag;
    bag.writeProperty("NeedList", Variant("ctxItems"));
    bag.writeProperty("ID", Variant("{1}"));
    bag.writeProperty("Цена", Variant(1));
    bag.writeProperty("NEEDLIST", Variant("ctxPartners"));
    bag.writeProperty("id", Variant::null());

    EXPECT_EQ(bag.names(), (std::vector<std::string>{"NeedList", "ID", "Цена"}));
    EXPECT_EQ(bag.count(), 3u);
    EXPECT_EQ(bag.readProperty("needlist").str(), "ctxPartners");
    EXPECT_TRUE(bag.readProperty("Id").isNull());
    EXPECT_TRUE(bag.hasProperty("nEEDlIST"));
    // Only ASCII letters fold; other text compares exactly.
    EXPECT_FALSE(bag.hasProperty("ЦЕНА"));

    auto loaded = PropertyBag::fromContents(bag.contents());
    EXPECT_EQ(loaded->names(), bag.names());
    EXPECT_EQ(loaded->readProperty("NEEDLIST").str(), "ctxPartners");
}

TEST(PropertyBagTest, RefusesValuesThatCannotBeWritten) {
    PropertyBag bag;
    bag.writeProperty("Kept", Variant(1));
    auto expectRefused = [&](const Variant& v) {
        try {
            bag.writeProperty("Bad", v);
            ADD_FAILURE() << "accepted a " << typeName(v);
        } catch (const Error& e) {
            EXPECT_EQ(e.number(), errc::InvalidProcedureCall);
        }
    };
    expectRefused(Variant(makeRef<Plain>()));
    expectRefused(Variant(std::vector<Variant>{Variant(makeRef<Plain>())}));
    expectRefused(Variant(std::string("\xC0\xAF")));      // overlong '/'
    expectRefused(Variant(std::string("\xED\xA0\x80")));  // a surrogate
    expectRefused(Variant(Date{std::nan("")}));
    expectRefused(Variant(Date{3e6}));
    Variant deep = Variant(1);
    for (int i = 0; i < kMaxPersistDepth; ++i)
        deep = Variant(std::vector<Variant>{deep});
    expectRefused(deep);
    EXPECT_THROW(bag.writeProperty("\xFF", Variant(1)), Error);
    EXPECT_EQ(bag.names(), std::vector<std::string>{"Kept"});
}

TEST(PropertyBagTest, ABagHoldingItselfFailsToWriteInsteadOfRecursing) {
    auto bag = makeRef<PropertyBag>();
    bag->writeProperty("Self", Variant(bag));
    try {
        bag->contents();
        ADD_FAILURE() << "wrote a bag that holds itself";
    } catch (const Error& e) {
        EXPECT_EQ(e.number(), errc::InvalidProcedureCall);
        EXPECT_NE(e.description().find("Self"), std::string::npos);
    }
    bag->writeProperty("Self", Variant());  // break the cycle
}

TEST(PropertyBagTest, ObjectsLoadThroughTheirRegisteredLoader) {
    registerPersistLoader("TestNote", [](ByteReader& r, int) -> ObjectRef {
        return makeRef<Note>("TestNote", std::string(r.str()));
    });
    PropertyBag bag;
    bag.writeProperty("Note", Variant(makeRef<Note>("TestNote", "бележка")));
    bag.writeProperty("Unknown", Variant(makeRef<Note>("TestUnregistered", "x")));
    expectInvalid(bag.contents(), "unknown object kind \"TestUnregistered\"");

    bag.writeProperty("Unknown", Variant());
    auto loaded = PropertyBag::fromContents(bag.contents());
    auto* note = query<Note>(loaded->readProperty("Note").object());
    ASSERT_NE(note, nullptr);
    EXPECT_EQ(note->text(), "бележка");

    // A loader that leaves part of its object's bytes unread is caught.
    registerPersistLoader("TestShortReader", [](ByteReader& r, int) -> ObjectRef {
        r.u8();
        return makeRef<Note>("TestShortReader", "");
    });
    PropertyBag shortBag;
    shortBag.writeProperty("N", Variant(makeRef<Note>("TestShortReader", "abc")));
    expectInvalid(shortBag.contents(), "does not fill its length");
}

TEST(PropertyBagTest, NoBytesGiveAnEmptyBag) {
    auto bag = PropertyBag::fromContents({});
    EXPECT_EQ(bag->count(), 0u);
}

// A bag holding one value of every kind, nested bags and arrays: the base for
// the damage tests below.
Bytes richContents() {
    auto inner = makeRef<PropertyBag>();
    inner->writeProperty("Rows", Variant(std::vector<Variant>{Variant("ред"), Variant(2)}));
    inner->writeProperty("Sum", Variant(Decimal::fromParts(99, 1, 28, true)));
    PropertyBag bag;
    bag.writeProperty("ID", Variant("{6B29FC40-CA47-1067-B31D-00DD010662DA}"));
    bag.writeProperty("Flag", Variant(true));
    bag.writeProperty("B", Variant::byte(3));
    bag.writeProperty("I", Variant::integer(-4));
    bag.writeProperty("D", Variant(0.5));
    bag.writeProperty("C", Variant(Currency{12345}));
    bag.writeProperty("When", Variant(Date{45000.25}));
    bag.writeProperty("E", Variant::error(5));
    bag.writeProperty("Raw", Variant(Bytes{1, 2, 3}));
    bag.writeProperty("Inner", Variant(inner));
    bag.writeProperty("None", Variant::nothing());
    bag.writeProperty("Null", Variant::null());
    return bag.contents();
}

TEST(PropertyBagTest, EveryTruncationFails) {
    const Bytes full = richContents();
    for (size_t n = 1; n < full.size(); ++n) {
        SCOPED_TRACE(n);
        expectInvalid(std::span(full).first(n));
    }
    Bytes longer = full;
    longer.push_back(0);
    expectInvalid(longer, "after the end");
}

TEST(PropertyBagTest, DamagedBytesFailCleanlyOrDecodeToSomethingThatRoundTrips) {
    const Bytes full = richContents();
    int failures = 0;
    for (size_t i = 0; i < full.size(); ++i) {
        for (uint8_t mask : {0x01, 0x80, 0xFF}) {
            Bytes damaged = full;
            damaged[i] ^= mask;
            try {
                auto bag = PropertyBag::fromContents(damaged);
                auto again = PropertyBag::fromContents(bag->contents());
                EXPECT_EQ(again->contents(), bag->contents()) << "byte " << i;
            } catch (const Error& e) {
                EXPECT_EQ(e.number(), errc::InvalidData) << e.description();
                ++failures;
            }
        }
    }
    EXPECT_GT(failures, 0);
}

TEST(PropertyBagTest, RejectsHugeLengthFields) {
    const uint8_t huge[] = {0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0x01};
    auto withValue = [](std::initializer_list<uint8_t> value) {
        Bytes b = header(1);
        b.insert(b.end(), {1, 'x'});
        b.insert(b.end(), value);
        return b;
    };
    Bytes count = {'P', 'B', 'A', 'G', 1};
    count.insert(count.end(), std::begin(huge), std::end(huge));
    expectInvalid(count, "length exceeds");

    Bytes name = header(1);
    name.insert(name.end(), std::begin(huge), std::end(huge));
    expectInvalid(name, "length exceeds");

    for (uint8_t kind : {11, 13, 14}) {  // text, array, bytes
        Bytes b = withValue({kind});
        b.insert(b.end(), std::begin(huge), std::end(huge));
        expectInvalid(b, "length exceeds");
    }
    // An object's 64-bit length.
    Bytes obj = withValue({16, 11, 'P', 'r', 'o', 'p', 'e', 'r', 't', 'y', 'B', 'a', 'g'});
    obj.insert(obj.end(), 8, 0xFF);
    expectInvalid(obj, "object length exceeds");
    // A varint longer than ten bytes.
    Bytes endless = {'P', 'B', 'A', 'G', 1};
    endless.insert(endless.end(), 11, 0x80);
    expectInvalid(endless);
}

TEST(PropertyBagTest, RejectsInvalidValues) {
    auto one = [](std::initializer_list<uint8_t> value) {
        Bytes b = header(1);
        b.insert(b.end(), {1, 'x'});
        b.insert(b.end(), value);
        return b;
    };
    expectInvalid(Bytes{'P', 'B', 'A', 'X', 1, 0}, "signature");
    expectInvalid(Bytes{'P', 'B', 'A', 'G', 2, 0}, "version 2");
    expectInvalid(Bytes{'P', 'B', 'A', 'G', 0, 0}, "version 0");
    expectInvalid(one({99}), "unknown value kind");
    expectInvalid(one({3, 2}), "boolean");
    expectInvalid(one({9, 1, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 29, 0}), "scale");
    expectInvalid(one({9, 1, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 2, 2}), "sign");
    expectInvalid(one({10, 0, 0, 0, 0, 0, 0, 0xF8, 0x7F}), "date");  // NaN
    expectInvalid(one({11, 2, 0xC3, 0x28}), "UTF-8");
    expectInvalid(one({16, 0, 0, 0, 0, 0, 0, 0, 0, 0}), "tag");
    expectInvalid(one({16, 3, 'a', ' ', 'b', 0, 0, 0, 0, 0, 0, 0, 0}), "tag");

    Bytes duplicate = header(2);
    duplicate.insert(duplicate.end(), {2, 'I', 'D', 0, 2, 'i', 'd', 0});
    expectInvalid(duplicate, "duplicate");
    Bytes badName = header(1);
    badName.insert(badName.end(), {1, 0xFF, 0});
    expectInvalid(badName, "name");
}

TEST(PropertyBagTest, RejectsNestingBeyondTheLimit) {
    auto nestedArrays = [](int levels) {
        Bytes b = header(1);
        b.insert(b.end(), {1, 'x'});
        for (int i = 0; i < levels; ++i)
            b.insert(b.end(), {13, 1});
        b.push_back(0);
        return b;
    };
    // A property value sits at depth 1, so this many arrays still fit.
    EXPECT_NO_THROW(PropertyBag::fromContents(nestedArrays(kMaxPersistDepth - 1)));
    expectInvalid(nestedArrays(kMaxPersistDepth), "nested deeper");
    expectInvalid(nestedArrays(100000), "nested deeper");

    // Bags inside bags, built from the innermost outwards.
    auto nestedBags = [](int levels) {
        Bytes body = PropertyBag().contents();
        for (int i = 0; i < levels; ++i) {
            Bytes outer = header(1);
            outer.insert(outer.end(), {1, 'b', 16, 11});
            for (char c : PropertyBag::kTag)
                outer.push_back(static_cast<uint8_t>(c));
            uint64_t length = body.size();
            ByteWriter(outer).u64(length);
            outer.insert(outer.end(), body.begin(), body.end());
            body = std::move(outer);
        }
        return body;
    };
    EXPECT_NO_THROW(PropertyBag::fromContents(nestedBags(kMaxPersistDepth)));
    expectInvalid(nestedBags(kMaxPersistDepth + 1), "nested deeper");
    expectInvalid(nestedBags(2000), "nested deeper");
}

TEST(PropertyBagTest, LateBoundMembers) {
    auto bag = makeRef<PropertyBag>();
    std::vector<Variant> write{Variant("Head"), Variant(42)};
    callByName(bag.get(), "WriteProperty", write);
    std::vector<Variant> read{Variant("HEAD")};
    EXPECT_TRUE(callByName(bag.get(), "readproperty", read) == Variant(42));
    std::vector<Variant> readDefault{Variant("Rows"), Variant("няма")};
    EXPECT_TRUE(callByName(bag.get(), "ReadProperty", readDefault) == Variant("няма"));
    std::vector<Variant> readMissing{Variant("Rows"), Variant::missing()};
    EXPECT_TRUE(callByName(bag.get(), "ReadProperty", readMissing).isEmpty());

    Variant contents = getProperty(bag.get(), "Contents");
    ASSERT_TRUE(contents.isBytes());
    EXPECT_EQ(contents.bytes(), bag->contents());

    auto other = makeRef<PropertyBag>();
    putProperty(other.get(), "Contents", contents);
    EXPECT_TRUE(other->readProperty("Head") == Variant(42));
    EXPECT_TRUE(getProperty(other.get(), "Count") == Variant(1));
    // A failed load leaves the bag as it was.
    EXPECT_THROW(putProperty(other.get(), "Contents", Variant(Bytes{1, 2, 3})), Error);
    EXPECT_TRUE(other->readProperty("Head") == Variant(42));

    std::vector<Variant> tooFew{Variant("Head")};
    EXPECT_THROW(callByName(bag.get(), "WriteProperty", tooFew), Error);
    EXPECT_THROW(callByName(bag.get(), "NoSuchMember"), Error);
}

}  // namespace
}  // namespace pelta
