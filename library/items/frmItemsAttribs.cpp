#include "library/items/frmItemsAttribs.h"

namespace PeltaNom15 {

const char* const kItemAttribGroups =
    "1|Основни|2|Мерки|3|Трансформиране при фактуриране|4|Нормативна цена|5|Срокове|6|Внос|"
    "7|Данъци и такси|8|Интрастат|9|Отпечатване|10|Центрове на себестойност при продажби|"
    "99|Други";

namespace {

using E = AttribEditor;

constexpr const char* kQuantityFormat = "#,##0.000#####";
constexpr const char* kPriceFormat = "#,##0.00######";
constexpr const char* kCountFormat = "#,##0";
constexpr const char* kOrderFormat = "#,##0.0#######";
constexpr const char* kPeriodUnits = "0|Месеца|1|Дни";
constexpr const char* kOffers = "Използва се при [b]Печат на ценови оферти[/b].";
constexpr const char* kSalePrint = "Използва се при печат на продажба/фактура.";
constexpr const char* kCostCenters =
    "Използва се за автоматично попълване на центрове на себестойност при продажби.";

ItemAttribute A(int32_t Group, const char* Caption, const char* Field, E Editor, const char* Help,
                const char* Format = "", const char* Reference = "", const char* Values = "",
                const char* Shown = "") {
    ItemAttribute a;
    a.Decl.Group = Group;
    a.Decl.Caption = Caption;
    a.Decl.Field = Field;
    a.Decl.Editor = Editor;
    a.Decl.Format = Format;
    a.Decl.Values = Values;
    a.Decl.ShownField = Shown;
    a.Decl.Help = Help;
    a.Reference = Reference;
    return a;
}

ItemAttribute Entry(int32_t Group, const char* Caption, const char* Field, const char* Help,
                    const char* Format = "") {
    return A(Group, Caption, Field, E::Entry, Help, Format);
}

ItemAttribute List(int32_t Group, const char* Caption, const char* Field, const char* Reference,
                   const char* Help) {
    return A(Group, Caption, Field, E::List, Help, "", Reference);
}

ItemAttribute Fixed(int32_t Group, const char* Caption, const char* Field, const char* Values,
                    const char* Help) {
    return A(Group, Caption, Field, E::FixedList, Help, "", "", Values);
}

ItemAttribute Check(int32_t Group, const char* Caption, const char* Field, const char* Help) {
    return A(Group, Caption, Field, E::CheckBox, Help);
}

ItemAttribute Pick(int32_t Group, const char* Caption, const char* Field, const char* Shown,
                   const char* Help) {
    return A(Group, Caption, Field, E::Selector, Help, "", "", "", Shown);
}

std::vector<ItemAttribute> Build() {
    return {
        // 1 Основни
        Entry(1, "Допълнително име", "Name2",
              "Име на продукта на чужд език. Отпечатва се в документите във валута."),
        List(1, "Валута по подразбиране", "Currency_ID", "Currency",
             "Валута, която се използва при въвеждане на ценови листи и в ред на документ, за "
             "който няма цена от ценова листа."),
        List(1, "Допълнителна мярка", "SecMeasure_ID", "Measure",
             "Втора мярка за количества и цени в складовите документи, ценовите листи и "
             "етикетите."),
        Fixed(1, "Ценообразуване при заприходяване в склада", "PriceMake",
              "0|(Няма)|1|На база обем|2|На база тегло",
              "Начин на образуване на цените на съставките на съставен продукт при генериране "
              "на складов документ."),
        // 2 Мерки
        Entry(2, "Нето тегло", "WeightNeto",
              "Използва се при ценообразуване на генерирани складови документи и в Интрастат.",
              kQuantityFormat),
        Entry(2, "Бруто тегло", "WeightBruto",
              "Показва се в колоната бруто тегло на търговските документи и при печат на "
              "заявки.",
              kQuantityFormat),
        Entry(2, "Нето обем", "VolumeNeto",
              "Използва се при ценообразуване на генерирани складови документи.", kQuantityFormat),
        Entry(2, "Бруто обем", "VolumeBruto",
              "Показва се в колоната бруто обем на търговските документи и при печат на "
              "заявки.",
              kQuantityFormat),
        Entry(2, "Прецизност в осн. мярка", "BasicMeasureScale",
              "Брой знаци след десетичната точка на количеството в основна мярка в редовете на "
              "продажби и заявки. От 0 до 4.",
              kCountFormat),
        Entry(2, "Прецизност крайна цена с ДДС", "VatPriceScale",
              "Брой знаци след десетичната точка на крайната цена с отстъпка и ДДС в редовете на "
              "продажби и заявки.",
              kCountFormat),
        Entry(2, "Прецизност крайна цена с TO%", "PriceScale",
              "Брой знаци след десетичната точка на крайната цена с отстъпка в редовете на "
              "продажби.",
              kCountFormat),
        // 3 Трансформиране при фактуриране
        Pick(3, "Продукт", "SecItm_ID", "SecItmName",
             "Обобщаващ продукт, който замества този във фактурите, генерирани от продажби."),
        List(3, "Мярка", "SecMeasure2_ID", "Measure",
             "Мярка на реда на заместващия продукт във фактурата."),
        Pick(3, "Счетоводен продукт", "AccItm_ID", "AccItmName",
             "Обобщаващ продукт, който се използва при осчетоводяване на фактурата."),
        // 4 Нормативна цена
        Check(4, "Използва за заприходяване в склада", "IsRatePrice",
              "Складовите документи и заприхождаванията от покупки използват нормативната "
              "цена."),
        Entry(4, "Цена по подразбиране", "DefRatePrice", "Доставна цена по подразбиране.",
              kPriceFormat),
        // 5 Срокове
        Entry(5, "Гаранционен срок", "WarrantyPeriod",
              "Гаранционен срок, който се отпечатва на етикетите за клиенти.", kCountFormat),
        Fixed(5, "Мярка на гаранционен срок", "WarrantyMeasure", kPeriodUnits,
              "Мерна единица на гаранционния срок."),
        Entry(5, "Срок на годност", "LifePeriod",
              "Срок на годност, който се отпечатва на етикетите за клиенти.", kCountFormat),
        Fixed(5, "Мярка на срок на годност", "LifeMeasure", kPeriodUnits,
              "Мерна единица на срока на годност."),
        // 6 Внос
        Pick(6, "Производител", "ProducerCg_ID", "ProducerCgName",
             "Производител на продукта. Показва се в редовете на продажби и на етикетите за "
             "клиенти."),
        Pick(6, "Вносител", "ImporterCg_ID", "ImporterCgName",
             "Вносител на продукта. Показва се на етикетите за клиенти."),
        // 7 Данъци и такси
        Entry(7, "ДДС ставка", "Vat",
              "Ставка на ДДС, с която се изчислява колоната цена с ДДС на ценовите листи.",
              "General Number"),
        Entry(7, "Акциз за осн. мярка", "Excise",
              "Акциз по подразбиране за основна мярка на партидите при покупки и "
              "заприхождавания."),
        Entry(7, "Еко такса", "Ecotax", "Само за сведение. Не се използва другаде."),
        List(7, "Митническа тарифа", "DutyTariff_id", "DutyTariffs",
             "Използва се при ценообразуване с транспортни разходи."),
        Check(7, "Разрешено включване ДДС в цената", "IsVatAllowed",
              "Дали в редовете на продажби ДДС може да се включва в цената. Ако не е "
              "разрешено, продуктът винаги се фактурира."),
        // 8 Интрастат
        List(8, "Интрастат код", "Intrastat_ID", "Intrastat",
             "Използва се в дневниците и декларациите по Интрастат."),
        List(8, "Интрастат допълнителна мярка", "IntrAddMeasure_ID", "Measure",
             "Допълнителна мярка по Интрастат."),
        // 9 Отпечатване
        Check(9, "Отпечатване само на обща стойност", "RowsumPrintOnly",
              "При печат на продажби се показва само общата стойност на реда. Използва се при "
              "търговски отстъпки."),
        Entry(9, "Партида по подразбиране", "DefaultLot",
              "Партида, която се отпечатва, когато редът няма партида."),
        Entry(9, "Клас по подразбиране", "DefaultClass",
              "Клас, който се отпечатва, когато редът няма клас, и в ценовите оферти."),
        Fixed(9, "Данъчна група за касова бележка", "TaxGroup", "1|А|2|Б|3|В|4|Г",
              "Данъчна група по ДДС при печат на касови бележки на фискално устройство."),
        Entry(9, "Експлоатационна информация", "OperatingDetails",
              "Състав или информация, изисквана от закона, която се отпечатва на етикетите за "
              "клиенти."),
        Entry(9, "Текст на етикет", "LabelText",
              "Допълнителен текст, който се отпечатва след описанието на етикетите за "
              "клиенти."),
        Entry(9, "Описание", "Description", "Особености и изисквания към продукта."),
        Entry(9, "Сорт", "Kind", kOffers),
        Entry(9, "Допълнителен сорт", "Kind2", kOffers),
        Entry(9, "Калибър", "Caliber", kOffers),
        Entry(9, "Допълнителен калибър", "Caliber2", kOffers),
        Entry(9, "Произход", "Origin", kOffers),
        Entry(9, "Допълнителен произход", "Origin2", kOffers),
        Entry(9, "Опаковка", "Packing", kOffers),
        Entry(9, "Допълнителна опаковка", "Packing2", kOffers),
        Entry(9, "Разрешително", "Permit", kSalePrint),
        Entry(9, "Концентрация", "Concentration", kSalePrint),
        Entry(9, "Пределна цена с ДДС", "MarginalPriceVat", "Пределна цена с ДДС.", kPriceFormat),
        Entry(9, "Ценова група", "PriceGroup", "Ценова група.", "General Number"),
        // 10 Центрове на себестойност при продажби
        Pick(10, "Структурен център на себестойност", "CcStruct_ID", "StructureName", kCostCenters),
        Pick(10, "Обект/проект", "CcProject_ID", "ProjectName", kCostCenters),
        Pick(10, "Друг център на себестойност", "CcOther_ID", "OtherName", kCostCenters),
        A(10, "Направление", "FinStruct_ID", E::TreeList,
          "Финансово направление. Могат да се избират само крайни разклонения.", "", "FinStruct"),
        // 99 Други
        Entry(99, "Минимално кол. за заявка", "MinOrderQuo",
              "Минимално количество в заявките към доставчици и в справката за минимални и "
              "максимални количества.",
              kOrderFormat),
        Entry(99, "Приоритет", "Priority", "Приоритет на продукта в справката за етикети.",
              kOrderFormat),
        Check(99, "Задължителна партида", "IsLotRequired",
              "При приключване на търговски документ се проверява дали всеки ред на продукта има "
              "партида."),
        Check(99, "Амбалаж", "IsPacking",
              "Продуктът участва в генерираните в склада разписки за амбалаж."),
        Pick(99, "Основен вариант", "VariantParentItm_ID", "VariantParentItmName",
             "Основен вариант при показване на вариантите по категории в уеб магазин. Носи "
             "дименсиите, по които се показват вариантите."),
    };
}

}  // namespace

const std::vector<ItemAttribute>& ItemAttributes() {
    static const std::vector<ItemAttribute> attributes = Build();
    return attributes;
}

}  // namespace PeltaNom15
