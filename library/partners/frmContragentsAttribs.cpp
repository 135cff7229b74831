// The partner's attribute panel: further head fields in groups, each a
// declared control bound to its field, and the value lists of the fixed
// choices.
#include "library/partners/frmContragentsAttribs.h"

namespace PeltaNom15 {

const char* const kAttributeGroups =
    "1|Основни|2|Адрес на доставка|3|Други адреси|4|Отложено плащане|5|Склад|6|Продажби|7|Центрове "
    "на себестойност при продажби|9|Други";

const std::vector<AttributeDecl>& ContragentAttributes() {
    static const std::vector<AttributeDecl> attributes = {
        {"Основни", "Ценова листа", "PriceList_ID", ControlKind::Combo, "", "", "PriceListType"},
        {"Основни", "Схема ТО", "Disc_ID", ControlKind::Combo, "", "", "DiscountSchema"},
        {"Основни", "Допълнително име", "Name2", ControlKind::Text, "", "", ""},
        {"Основни", "Телефони", "Phone", ControlKind::Text, "", "", ""},
        {"Основни", "Кредитен лимит", "CreditLimitation", ControlKind::Number, "#,##0.00######", "",
         ""},
        {"Основни", "Забрана продажби/заявки при просрочени задължения (дни)", "MaxDaysInArrears",
         ControlKind::Number, "#,##0", "", ""},
        {"Основни", "Номер на локация (GLN)", "GlobalLocationNumber", ControlKind::Text, "", "",
         ""},
        {"Основни", "Ветеринарен рег. номер", "DvskNo", ControlKind::Text, "", "", ""},
        {"Адрес на доставка", "Държава", "Country_ID", ControlKind::Combo, "", "", "Countries"},
        {"Адрес на доставка", "Населено място", "City_ID", ControlKind::Combo, "", "", "Cities"},
        {"Адрес на доставка", "Пощенски код", "PostalCode", ControlKind::Text, "", "", ""},
        {"Адрес на доставка", "Улица / Квартал", "Street_ID", ControlKind::Selector, "", "", ""},
        {"Адрес на доставка", "  Номер (Улица)", "StreetNo", ControlKind::Text, "", "", ""},
        {"Адрес на доставка", "  Блок (Квартал)", "BlockNo", ControlKind::Text, "", "", ""},
        {"Адрес на доставка", "  Вход (Квартал)", "Entrance", ControlKind::Text, "", "", ""},
        {"Адрес на доставка", "  Етаж (Квартал)", "FloorNo", ControlKind::Text, "", "", ""},
        {"Адрес на доставка", "  Апартамент (Квартал)", "Apartment", ControlKind::Text, "", "", ""},
        {"Адрес на доставка", "Пояснение", "Place", ControlKind::Text, "", "", ""},
        {"Други адреси", "За кореспонденция", "CorrespAddress", ControlKind::Text, "", "", ""},
        {"Други адреси", "Допълнителен адрес за кореспонденция", "CorrespAddress2",
         ControlKind::Text, "", "", ""},
        {"Други адреси", "Факс", "Fax", ControlKind::Text, "", "", ""},
        {"Други адреси", "Ел. пощи", "Email", ControlKind::Text, "", "", ""},
        {"Други адреси", "В интернет (URL)", "WebAddress", ControlKind::Text, "", "", ""},
        {"Други адреси", "Допълнителен адрес", "Address2", ControlKind::Text, "", "", ""},
        {"Отложено плащане", "При продажба (дни)", "InvDaysPostponePmt", ControlKind::Number,
         "#,##0", "", ""},
        {"Отложено плащане", "При покупка (дни)", "SupDaysPostponePmt", ControlKind::Number,
         "#,##0", "", ""},
        {"Склад", "Метод на изписване от склад", "CgStoreMode", ControlKind::Combo, "",
         "0|Среднопретеглена цена|1|FIFO по дата на доставка|2|LIFO по дата на доставка|3|FIFO по "
         "дата на годност",
         ""},
        {"Склад", "Задължително равнение на количества на продажба със свързаните РСД",
         "SellEqualStoreQuantity", ControlKind::CheckBox, "", "", ""},
        {"Склад", "Задължително валидиране на РСД", "MandatoryValidationRSD", ControlKind::CheckBox,
         "", "", ""},
        {"Склад", "МОЛ по подразбиране", "OwnPrsMol_ID", ControlKind::Combo, "", "", "OwnPersons"},
        {"Продажби", "Начин на плащане", "WayOfPayment", ControlKind::Combo, "",
         "0|(Не е настроен)|1|В брой|2|По банков път|3|С карта|4|Наложен платеж|5|Авансов "
         "отчет|6|Online плащане|7|По договор|8|Пощенски паричен превод",
         ""},
        {"Продажби", "Данъчен документ", "RequiredInvDoc", ControlKind::Combo, "",
         "0|(Не е настроен)|1|Фактура|2|Отчет за продажби", ""},
        {"Продажби", "Издател на документи", "InvCgOwn_ID", ControlKind::Selector, "", "", ""},
        {"Продажби", "Контрагент за фактуриране", "CgForInvoice_ID", ControlKind::Selector, "", "",
         ""},
        {"Продажби", "Задължително поделение", "IsDepRequired", ControlKind::CheckBox, "", "", ""},
        {"Продажби", "Издаване на акцизни фактури", "IsExcisePrintable", ControlKind::CheckBox, "",
         "", ""},
        {"Продажби", "Лиценз No.", "License", ControlKind::Text, "", "", ""},
        {"Продажби", "Лиценз МИ No.", "LicenseMi", ControlKind::Text, "", "", ""},
        {"Центрове на себестойност при продажби", "Структурен център на себестойност",
         "CcStruct_ID", ControlKind::Selector, "", "", ""},
        {"Центрове на себестойност при продажби", "Обект/проект", "CcProject_ID",
         ControlKind::Selector, "", "", ""},
        {"Центрове на себестойност при продажби", "Друг център на себестойност", "CcOther_ID",
         ControlKind::Selector, "", "", ""},
        {"Други", "Отделни настройки печат на док.", "CustomPrintSettings", ControlKind::CheckBox,
         "", "", ""},
        {"Други", "Програма за бонус точки", "Bonus_ID", ControlKind::Combo, "", "", "Bonuses"},
    };
    return attributes;
}

}  // namespace PeltaNom15
