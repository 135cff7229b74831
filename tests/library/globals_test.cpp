// Shared helpers: conversions that never raise, the message formatter, text
// helpers, value dumps, termination routines and selector identifiers.
#include <gtest/gtest.h>

#include "library/frame/mdClassFactory.h"
#include "library/frame/mdGlobals.h"
#include "platform/automation/error.h"
#include "tests/library/frame_support.h"

using namespace PeltaNom15;
using pelta::Variant;

namespace {

TEST(Printf, PercentInAnArgumentSurvives) {
    EXPECT_EQ(Printf(std::string("%1") + " от " + "%2", "50%", 100), "50% от 100");
    EXPECT_EQ(Printf("%1 and %2", "%2", "x"), "%2 and x");
}

TEST(Printf, TenthPlaceholderIsNotTakenForTheFirst) {
    EXPECT_EQ(Printf("%10|%1|%2", "a", "b", "c", "d", "e", "f", "g", "h", "i", "j"), "j|a|b");
}

TEST(Printf, ArgumentsOfAnyKindAndMissingOnes) {
    EXPECT_EQ(Printf("%1 %2 %3", true, 2.5, Variant::null()), "True 2.5 ");
    EXPECT_EQ(Printf("%1 and %2", "only"), "only and %2");
    EXPECT_EQ(Printf("no placeholders"), "no placeholders");
    EXPECT_EQ(Printf("%1%1", "x"), "xx");
}

TEST(Conversions, NeverRaise) {
    EXPECT_EQ(C2Lng(Variant("not a number")), 0);
    EXPECT_EQ(C2Lng(Variant("12")), 12);
    EXPECT_EQ(C2Lng(Variant("1e20")), 0);  // overflow
    EXPECT_EQ(C2Lng(Variant::null()), 0);
    EXPECT_EQ(C2Dbl(Variant("2.5")), 2.5);
    EXPECT_EQ(C2Dbl(Variant(pelta::ObjectRef())), 0.0);
    EXPECT_EQ(C2Str(Variant("as is ")), "as is ");
    EXPECT_EQ(C2Str(Variant(true)), "True");
    EXPECT_EQ(C2Str(Variant(false)), "False");
    EXPECT_EQ(C2Str(Variant::null()), "");
    EXPECT_EQ(C2Str(Variant(std::vector<Variant>{1, 2})), "");
    EXPECT_TRUE(C2Bool(Variant("True")));
    EXPECT_FALSE(C2Bool(Variant("False")));
    EXPECT_FALSE(C2Bool(Variant("maybe")));
    EXPECT_TRUE(C2Bool(Variant(-1)));
    EXPECT_EQ(C2Date(Variant("no date")).oa, 0.0);
    EXPECT_EQ(C2Date(Variant(pelta::makeDate(2024, 2, 29))).oa, pelta::makeDate(2024, 2, 29).oa);
    EXPECT_FALSE(C2Obj(Variant(5)));
    auto o = pelta::makeRef<frametest::RecordingHost>();
    EXPECT_EQ(C2Obj(Variant(pelta::ObjectRef(o))).get(), static_cast<pelta::Object*>(o.get()));
    EXPECT_TRUE(C2Bytes(Variant()).empty());
    EXPECT_TRUE(C2Bytes(Variant::null()).empty());
    EXPECT_EQ(C2Bytes(Variant(pelta::Bytes{1, 2})), (pelta::Bytes{1, 2}));
    EXPECT_EQ(C2Bytes(Variant(std::vector<Variant>{1, 255})), (pelta::Bytes{1, 255}));
    EXPECT_TRUE(C2Bytes(Variant(std::vector<Variant>{1, 256})).empty());
}

TEST(TextHelpers, SqlQuoteDoublesEverySingleQuote) {
    EXPECT_EQ(SqlQuote("O'Brien's 'bar'"), "O''Brien''s ''bar''");
    EXPECT_EQ(SqlQuote("none"), "none");
    EXPECT_EQ(SqlQuote(""), "");
}

TEST(TextHelpers, IsGuid) {
    EXPECT_TRUE(IsGuid("{5B0E1C60-8e5d-4C63-9F0B-2C6F1A7D0001}"));
    EXPECT_FALSE(IsGuid("5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D0001"));
    EXPECT_FALSE(IsGuid("{5B0E1C60-8E5D-4C63-9F0B-2C6F1A7D000G}"));
    EXPECT_FALSE(IsGuid("{5B0E1C608-E5D-4C63-9F0B-2C6F1A7D0001}"));
    EXPECT_FALSE(IsGuid(""));
}

TEST(TextHelpers, SmallFormatters) {
    EXPECT_EQ(Nz("", "(none)"), "(none)");
    EXPECT_EQ(Nz("x", "(none)"), "x");
    EXPECT_EQ(FormatCount(0), "");
    EXPECT_EQ(FormatCount(999), "999");
    EXPECT_EQ(FormatCount(1234567), "1,234,567");
    EXPECT_EQ(FormatCount(-1000), "-1,000");
    EXPECT_EQ(FormatTime(pelta::makeDate(2024, 1, 1, 9, 5, 0)), "09:05");
    EXPECT_EQ(FormatTime(pelta::makeDate(2024, 1, 1, 23, 59, 7)), "23:59:07");
    EXPECT_EQ(Clamp(5, 1, 3), 3);
    EXPECT_EQ(Clamp(-5, 1, 3), 1);
    EXPECT_EQ(Clamp(2.5, 1.0, 3.0), 2.5);
}

TEST(DumpValue, EveryKind) {
    EXPECT_EQ(DumpValue(Variant()), "Empty");
    EXPECT_EQ(DumpValue(Variant::null()), "Null");
    EXPECT_EQ(DumpValue(Variant::missing()), "Missing");
    EXPECT_EQ(DumpValue(Variant::nothing()), "Nothing");
    EXPECT_EQ(DumpValue(Variant("say \"hi\"")), "\"say \"\"hi\"\"\"");
    EXPECT_EQ(DumpValue(Variant(pelta::Bytes{})), "Array(0 bytes)");
    EXPECT_EQ(DumpValue(Variant(pelta::Bytes{0x0A, 0xFF, 0})), "Array(3 bytes, 0A FF 00)");
    EXPECT_EQ(DumpValue(Variant(std::vector<Variant>{1, "a", Variant::null()})),
              "Array(1, \"a\", Null)");
    EXPECT_EQ(DumpValue(Variant(42)), "42");
}

// An object following the termination protocol, journalling into a list.
class Terminable final : public IZonTerminate {
public:
    Terminable(std::string n, std::vector<std::string>& j, bool refuse = false)
        : name(std::move(n)), journal(j), refuse(refuse) {}
    void QueryTerminate(bool& Cancel) override {
        journal.push_back(name + (Cancel ? " abandoned" : " asked"));
        if (!Cancel && refuse) Cancel = true;
    }
    void Terminate() override { journal.push_back(name + " terminated"); }
    std::string typeName() const override { return "Terminable"; }
    std::string name;
    std::vector<std::string>& journal;
    bool refuse;
};

Variant obj(std::string n, std::vector<std::string>& j, bool refuse = false) {
    return Variant(pelta::ObjectRef(pelta::makeRef<Terminable>(std::move(n), j, refuse)));
}

TEST(Termination, ObjectsInOrderCollectionsLastToFirst) {
    std::vector<std::string> j;
    std::vector<Variant> objects{obj("a", j),
                                 Variant(std::vector<Variant>{obj("b", j), obj("c", j)}),
                                 Variant(5), Variant::nothing(), obj("d", j)};
    bool cancel = false;
    QueryTerminateObjects(cancel, objects);
    EXPECT_FALSE(cancel);
    EXPECT_EQ(j, (std::vector<std::string>{"a asked", "c asked", "b asked", "d asked"}));
}

TEST(Termination, RefusalStopsTheWalkAndTellsThoseThatAgreed) {
    std::vector<std::string> j;
    std::vector<Variant> objects{
        obj("a", j), Variant(std::vector<Variant>{obj("b", j, true), obj("c", j)}), obj("d", j)};
    bool cancel = false;
    QueryTerminateObjects(cancel, objects);
    EXPECT_TRUE(cancel);
    EXPECT_EQ(j, (std::vector<std::string>{"a asked", "c asked", "b asked", "a abandoned",
                                           "c abandoned"}));
}

TEST(Termination, CancelOnEntryTellsEveryObject) {
    std::vector<std::string> j;
    std::vector<Variant> objects{obj("a", j, true), obj("b", j)};
    bool cancel = true;
    QueryTerminateObjects(cancel, objects);
    EXPECT_TRUE(cancel);
    EXPECT_EQ(j, (std::vector<std::string>{"a abandoned", "b abandoned"}));
}

TEST(Termination, TerminateObjectsDropsEveryReference) {
    std::vector<std::string> j;
    std::vector<Variant> objects{obj("a", j),
                                 Variant(std::vector<Variant>{obj("b", j), obj("c", j)})};
    TerminateObjects(objects);
    EXPECT_EQ(j, (std::vector<std::string>{"a terminated", "c terminated", "b terminated"}));
    EXPECT_TRUE(objects[0].isNothing());
    EXPECT_TRUE(objects[1].array().empty());

    auto x = pelta::makeRef<Terminable>("x", j);
    pelta::Ref<Terminable> y;
    TerminateRefs(x, y);
    EXPECT_FALSE(x);
    EXPECT_EQ(j.back(), "x terminated");
}

TEST(Termination, TerminateObjectWithAMessageShowsItAndKeepsTheObject) {
    frametest::HostInstall host;
    std::vector<std::string> j;
    auto o = pelta::makeRef<Terminable>("a", j, true);
    EXPECT_FALSE(TerminateObject(o.get(), "Има незаписани промени"));
    ASSERT_EQ(host->boxes.size(), 1u);
    EXPECT_EQ(host->boxes[0].Text, "Има незаписани промени");
    EXPECT_EQ(host->boxes[0].Style, vbExclamation);
    EXPECT_EQ(j, (std::vector<std::string>{"a asked"}));
}

TEST(Termination, TerminateObjectAsksWhetherToGoOnDespiteTheRefusal) {
    frametest::HostInstall host;
    std::vector<std::string> j;
    auto o = pelta::makeRef<Terminable>("a", j, true);
    host->answers = {vbOK};
    EXPECT_TRUE(TerminateObject(o.get()));
    ASSERT_EQ(host->boxes.size(), 1u);
    EXPECT_EQ(host->boxes[0].Text, Printf("Обект ще бъде терминиран, въпреки потребителски отказ "
                                          "или грешка при приключване\r\n\r\n%1",
                                          "Terminable"));
    EXPECT_EQ(host->boxes[0].Style, vbExclamation | vbOKCancel);
    EXPECT_EQ(j.back(), "a terminated");

    host->answers = {vbCancel};
    try {
        TerminateObject(o.get());
        FAIL() << "cancel must raise";
    } catch (const pelta::Error& e) {
        EXPECT_EQ(e.number(), static_cast<int32_t>(0x80040000));
        EXPECT_EQ(e.description(), "Termination canceled");
    }
}

TEST(Termination, TerminateObjectThatAgrees) {
    std::vector<std::string> j;
    auto o = pelta::makeRef<Terminable>("a", j);
    EXPECT_TRUE(TerminateObject(o.get()));
    EXPECT_EQ(j, (std::vector<std::string>{"a asked", "a terminated"}));
    EXPECT_TRUE(TerminateObject(nullptr));
}

TEST(ClassFactory, SelectorIdentifiersDifferOnlyInCase) {
    EXPECT_EQ(SelectorProgID("PeltaNom15.ctxItems", 0), "PeltaNom15.ctxItems");
    EXPECT_EQ(SelectorProgID("PeltaNom15.ctxItems", 1), "PeltaNom15.ctxItemS");
    EXPECT_EQ(SelectorProgID("PeltaNom15.ctxItems", 3), "PeltaNom15.ctxItEMS");
    EXPECT_EQ(SelectorProgID("ab", 5), "AB");
    EXPECT_EQ(SelectorProgID("ab", -1), "ab");
}

TEST(ClassFactory, NothingWithoutAFramework) {
    EXPECT_FALSE(FrameworkServices());
    EXPECT_FALSE(CreateFormExtender(nullptr, "Курсове", "ctxRatios"));
    EXPECT_FALSE(CreateGridExtender(nullptr, "grdList", "ctxRatios"));
    EXPECT_FALSE(CreateItemsSelector(nullptr, 1));
    EXPECT_FALSE(CreateItemsLotsSelector(nullptr, {}));
    EXPECT_TRUE(CreateSalesRequestSelectors(nullptr).Selectors.empty());
}

// A selector whose initialisation records its parameter.
class RecordingSelector final : public IZonSelectorInit {
public:
    bool Init(pelta::Object*, const std::string& Param) override {
        params.push_back(Param);
        return Param != "refuse";
    }
    static inline std::vector<std::string> params;
};

TEST(ClassFactory, SelectorsAreCreatedByIdentifierAndInitialised) {
    frametest::HostInstall host;
    for (const char* id : {"PeltaNom15.ctxFlat", "PeltaNom15.ctxCostCenters",
                           "PeltaTrade15.ctxInvDocuments", "PeltaCrm15.ctxReqDocuments"})
        pelta::registerLocalClass(
            id, [] { return pelta::ObjectRef(pelta::makeRef<RecordingSelector>()); });
    RecordingSelector::params.clear();
    EXPECT_TRUE(CreateFlatSelector(nullptr, 12, 2));
    EXPECT_TRUE(CreateCostCentersSelector(nullptr, "ProjectCC_ID"));
    EXPECT_FALSE(CreateCostCentersSelector(nullptr, "refuse"));
    auto pair = CreateSalesRequestSelectors(nullptr, 1);
    EXPECT_EQ(pair.Caption, "Документи за продажба|Документи за заявка");
    EXPECT_EQ(pair.Selectors.size(), 2u);
    EXPECT_EQ(RecordingSelector::params,
              (std::vector<std::string>{"12", "ProjectCC_ID", "refuse", "", ""}));
    for (const char* id : {"PeltaNom15.ctxFlat", "PeltaNom15.ctxCostCenters",
                           "PeltaTrade15.ctxInvDocuments", "PeltaCrm15.ctxReqDocuments"})
        pelta::unregisterLocalClass(id);
}

}  // namespace
