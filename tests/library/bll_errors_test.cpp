// Business-logic refusals turned into messages: each family of texts, the
// stock codes' markers, database-level codes with their details, unknown
// codes and the table display names.
#include <gtest/gtest.h>

#include <regex>

#include "library/contracts/Constants.h"
#include "library/frame/mdBllErrors.h"
#include "library/frame/mdGlobals.h"

using namespace PeltaNom15;

// The cases name only the texts they set.
#pragma GCC diagnostic ignored "-Wmissing-field-initializers"

namespace {

const std::string kNone = "(Няма)";
const std::string kBreak = "\r\n\r\n";

BllMessage compose(int32_t code, BllErrorInfo e = {}) {
    e.Code = code;
    return ComposeBllError(e);
}

TEST(BllErrors, SingleText) {
    auto m = compose(10);
    EXPECT_EQ(m.Text, "Дублиране на код");
    EXPECT_EQ(m.Style, vbExclamation);
    EXPECT_EQ(m.Details, "");
    EXPECT_EQ(compose(24).Text, "Недостатъчни права за извършване на операция");
    EXPECT_EQ(compose(1115).Text,
              "Невъзможна генерация на счетоводен документ.\r\n\r\nВалутата в документа е различна "
              "от валутата на редовете");
}

TEST(BllErrors, EmptyTextForAPlaceholderReadsNone) {
    EXPECT_EQ(compose(14).Text, Printf("Документ '%1' не е в състояние редакция", kNone));
    EXPECT_EQ(compose(14, {.DocText = "ПР 12"}).Text,
              Printf("Документ '%1' не е в състояние редакция", "ПР 12"));
    EXPECT_EQ(compose(30, {.RowText = "7"}).Text, Printf("Невалиден номер на ред %1", "7"));
    EXPECT_EQ(compose(7301, {.CgName = "Акме", .ILN = "380"}).Text,
              Printf("Неизвестно поделение на контрагент '%1' с GLN '%2'", "Акме", "380"));
}

TEST(BllErrors, AlternativeTextsFollowTheFilledPlaceholders) {
    EXPECT_EQ(compose(1, {.DocText = "Ф 100"}).Text,
              Printf("Няма права за достъп до документ %1", "Ф 100"));
    EXPECT_EQ(compose(1).Text, "Документът не е намерен");
    EXPECT_EQ(compose(33).Text, "Дублиране на Уникален номер на продажба (УНП)");
    EXPECT_EQ(compose(5, {.RowText = "3", .DocText = "Ф 1"}).Text,
              Printf("За мярката, в която се трансформира ред '%1' от '%2', няма настроен фасет в "
                     "списъци на продукт/материал",
                     "3", "Ф 1"));
    EXPECT_EQ(compose(5).Text,
              "За мярката, в която се трансформира ред при фактуриране, няма настроен фасет в "
              "списъци на продукт/материал");
    EXPECT_EQ(compose(7302, {.CgName = "Акме", .ILN = "380"}).Text,
              Printf("Неизвестен контрагент%1 с GLN '%2'", " 'Акме'", "380"));
    EXPECT_EQ(compose(7302, {.ILN = "380"}).Text,
              Printf("Неизвестен контрагент%1 с GLN '%2'", "", "380"));
    EXPECT_EQ(compose(7302).Text,
              "Съществуват неизвестни продукти в редовете на документа, но в базата липсва продукт "
              "с код 'НеизвПрод'");
    EXPECT_EQ(compose(8110, {.RowText = "E3"}).Text, Printf("Невалиден статус на ФУ: %1.", "E3"));
    EXPECT_EQ(compose(8110, {.DocText = "Каса 1"}).Text,
              Printf("Липсва настроен сериен номер на ФУ за %1.", "Каса 1"));
}

TEST(BllErrors, HeadingWithFurtherLinesMakesOneMessage) {
    auto m = compose(2006, {.DocText = "КИ 7"});
    EXPECT_EQ(m.Text,
              Printf("Към Продажбата/Фактурата е свързано приключено известие %1.", "КИ 7") +
                  kBreak + "Невъзможна промяна състоянието на документа" + kBreak +
                  "За да редактирате Продажбата/Фактурата, върнете в състояние на редакция всички "
                  "свързани известия.");
    EXPECT_EQ(m.Style, 0);
    EXPECT_EQ(compose(2044, {.DocText = "Ф 9"})
                  .Text.rfind(Printf("Документът '%1' е с отрицателна обща стойност.", "Ф 9"), 0),
              0u);
}

TEST(BllErrors, StockCodesReplaceTheMarkersAndCarryAHeading) {
    const std::string heading = std::string("Невъзможно приключване на документ") + "." + kBreak;
    const std::string onDate = ", на дата ";
    auto m = compose(3017, {.DocText = "Склад 1\x01"
                                       "01.02.2024\x01"});
    EXPECT_EQ(m.Text,
              heading + Printf("Няма достатъчно разполагаемо количество в склад %1.",
                               "Склад 1" + onDate + "01.02.2024, след последната операция"));
    EXPECT_EQ(compose(3001, {.DocText = "А\x01"
                                        "Д\x01"
                                        "ОП 5"})
                  .Text,
              heading + Printf("Няма достатъчно налично количество в склад %1.",
                               "А" + onDate + "Д, преди операция ОП 5"));
    EXPECT_EQ(compose(3004, {.DocText = "А\x01"
                                        "Д"})
                  .Text,
              heading + Printf("Съществуват два или повече редове с даден продукт, за сумата на "
                               "които няма достатъчно налично количество в склад %1.",
                               "А" + onDate + "Д"));
    EXPECT_EQ(compose(3018, {.DocText = "А"}).Text,
              heading + Printf("Съществуват два или повече редове с даден продукт, за сумата на "
                               "които няма достатъчно разполагаемо количество в склад %1.",
                               "А"));
    // Other codes leave the markers alone.
    EXPECT_EQ(compose(14, {.DocText = "А\x01"}).Text,
              Printf("Документ '%1' не е в състояние редакция", "А\x01"));
}

TEST(BllErrors, DatabaseCodesNameTheTableAndCarryTheDatabaseMessage) {
    auto m = compose(18, {.SqlError = "deadlock", .Table = "dbo.nom_items"});
    EXPECT_EQ(m.Text, Printf("Конкурентен достъп до таблица %1", Printf("с '%1'", "Продукти")));
    EXPECT_EQ(m.Details, "deadlock");

    auto from = compose(19, {.SqlError = "FK", .Table = "nom_persons", .Column = "ID"});
    EXPECT_EQ(from.Text, Printf("Отказана модификация заради съществуващи връзки от таблица %1",
                                Printf("с '%1'", "Персони")));
    EXPECT_EQ(from.Details, "FK");
    auto to = compose(19, {.Table = "nom_persons", .Column = "Department_ID"});
    EXPECT_EQ(to.Text, Printf("Отказана модификация заради некоректна връзка към таблица %1",
                              Printf("с '%1'", "Персони")));

    EXPECT_EQ(
        compose(20, {.Table = "nom_items", .Column = "Code"}).Text,
        Printf("Отказана модификация заради дублирани стойности по колони на '%2' в таблица %1",
               Printf("с '%1'", "Продукти"), "Code"));
    EXPECT_EQ(
        compose(20, {.Table = "nom_items"}).Text,
        Printf("Отказана модификация заради дублирани стойности по колони на '%2' в таблица %1",
               Printf("с '%1'", "Продукти"), "Неизвестен"));
    EXPECT_EQ(compose(10, {.SqlError = "x"}).Details, "");
}

TEST(BllErrors, UnknownCode) {
    auto m = compose(9999);
    EXPECT_EQ(m.Text, "9999 BllError = Непредвидена грешка");
    EXPECT_EQ(m.Style, vbExclamation);
}

TEST(BllErrors, EveryKnownCodeFillsEveryPlaceholder) {
    const BllErrorInfo full{0, "row", "doc", "lock", "cg", "iln", "sql", "nom_items", "Code"};
    const std::regex placeholder("%[0-9]");
    int known = 0;
    for (int32_t code = 0; code < 10000; ++code) {
        BllErrorInfo e = full;
        e.Code = code;
        auto m = ComposeBllError(e);
        if (m.Text == std::to_string(code) + " BllError = Непредвидена грешка") continue;
        ++known;
        EXPECT_FALSE(std::regex_search(m.Text, placeholder)) << code << ": " << m.Text;
        EXPECT_EQ(m.Text.find(kNone), std::string::npos) << code;
    }
    EXPECT_EQ(known, 122);
}

TEST(BllTableName, DocumentGroups) {
    EXPECT_EQ(BllTableName("inv_docs"), Printf("с '%1'", "Документи за продажба"));
    EXPECT_EQ(BllTableName("\"dbo\".\"INV_DocsDetails\""),
              Printf("с редове на '%1'", "Документи за продажба"));
    EXPECT_EQ(BllTableName("sup_docsattachments"),
              Printf("с прикрепени файлове на '%1'", "Документи за покупка"));
    EXPECT_EQ(BllTableName("sto_docs"), Printf("със '%1'", "Складови документи"));
    EXPECT_EQ(BllTableName("sto_docsdetails"), Printf("с редове на '%1'", "Складови документи"));
    EXPECT_EQ(BllTableName("sto_serialnumbers"), Printf("със '%1'", "Серийни номера"));
    EXPECT_EQ(BllTableName("sto_revdocs"), Printf("с '%1'", "Протоколи за инвентаризация"));
    EXPECT_EQ(BllTableName("acc_docs"), Printf("със '%1'", "Счетоводни документи"));
    EXPECT_EQ(BllTableName("con_docsversions"), Printf("с '%1'", "Договори"));
    EXPECT_EQ(BllTableName("con_dimensions"), Printf("с дименсии на '%1'", "Договори"));
    EXPECT_EQ(BllTableName("con_dimsmulti"), Printf("с дименсии на '%1'", "Договори"));
    EXPECT_EQ(BllTableName("sal_advdocs"), Printf("с '%1'", "Авансови РПВ"));
    EXPECT_EQ(BllTableName("sal_docs"), Printf("с '%1'", "Разчетно-платежни ведомости"));
}

TEST(BllTableName, MasterDataAndOthers) {
    EXPECT_EQ(BllTableName("DBO.NOM_ITEMS"), Printf("с '%1'", "Продукти"));
    EXPECT_EQ(BllTableName("nom_employees"), Printf("със '%1'", "Служители"));
    EXPECT_EQ(BllTableName("mpsetup"), Printf("с '%1'", "Настройки на системата"));
    EXPECT_EQ(BllTableName("dbo.Nom_Unknown"), "'Nom_Unknown'");
    EXPECT_EQ(BllTableName(""), "'Неизвестен'");
    EXPECT_EQ(BllTableName("\"\""), "'Неизвестен'");
}

TEST(BllDocMarkers, Forms) {
    EXPECT_EQ(BllDocMarkers("no markers"), "no markers");
    EXPECT_EQ(BllDocMarkers("\x01"), ", на дата ");
    EXPECT_EQ(BllDocMarkers("a\x01"
                            "b\x01"),
              "a, на дата b, след последната операция");
}

}  // namespace
