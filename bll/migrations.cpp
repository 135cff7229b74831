// The schema, created and upgraded by numbered migrations. Each migration runs
// in one transaction together with its row in sys_migrations, so a database is
// always at a whole version. Migrations are only ever appended.
#include <span>

#include "bll/database.h"
#include "bll/service.h"

namespace pelta::bll {

namespace {

struct Migration {
    int version;
    const char* name;
    const char* sql;
};

// The administrators' group and user that every database starts with.
constexpr const char* kMigration1 = R"sql(
CREATE TABLE sys_settings (
    Name VARCHAR(100) NOT NULL PRIMARY KEY,
    Kind VARCHAR(20) NOT NULL DEFAULT 'String'
        CHECK (Kind IN ('String', 'Long', 'Boolean', 'Decimal', 'Date', 'Guid')),
    Value TEXT
);

CREATE TABLE sec_users (
    ID GUID NOT NULL PRIMARY KEY,
    Name VARCHAR(100) NOT NULL UNIQUE,
    FullName VARCHAR(200),
    IsActive BOOLEAN NOT NULL DEFAULT 1
);

CREATE TABLE sec_groups (
    ID GUID NOT NULL PRIMARY KEY,
    Name VARCHAR(100) NOT NULL UNIQUE,
    IsAdmin BOOLEAN NOT NULL DEFAULT 0
);

CREATE TABLE sec_usergroups (
    User_ID GUID NOT NULL REFERENCES sec_users (ID) ON DELETE CASCADE,
    Group_ID GUID NOT NULL REFERENCES sec_groups (ID),
    PRIMARY KEY (User_ID, Group_ID)
);
CREATE INDEX ix_sec_usergroups_group ON sec_usergroups (Group_ID);

CREATE TABLE sec_grouprights (
    Group_ID GUID NOT NULL REFERENCES sec_groups (ID) ON DELETE CASCADE,
    Screen VARCHAR(100) NOT NULL,
    Rights INTEGER NOT NULL DEFAULT 0,
    PRIMARY KEY (Group_ID, Screen)
);

INSERT INTO sec_groups (ID, Name, IsAdmin)
    VALUES ('{6A1F0C2E-5B7D-4E21-9C3A-0F4B8D2E7A11}', 'Administrators', 1);
INSERT INTO sec_users (ID, Name, FullName, IsActive)
    VALUES ('{0B9E3D5A-1C2F-4A6B-8D7E-3F5A9C1B2E40}', 'admin', 'Administrator', 1);
INSERT INTO sec_usergroups (User_ID, Group_ID)
    VALUES ('{0B9E3D5A-1C2F-4A6B-8D7E-3F5A9C1B2E40}', '{6A1F0C2E-5B7D-4E21-9C3A-0F4B8D2E7A11}');

INSERT INTO sys_settings (Name, Kind, Value) VALUES
    ('DefCurrency_ID', 'Guid', NULL),
    ('DefPriceList_ID', 'Guid', NULL),
    ('DefVatPriceScale', 'Long', '2'),
    ('DefCgDimension_ID', 'Guid', NULL),
    ('DefItmDimensionName', 'String', ''),
    ('DefCgDimensionName', 'String', '');
)sql";

// Currencies, the banks that publish rates, and the rates: a head per bank
// and date, a row per currency. A rate row repeats its head's bank and date
// so that one currency has one rate per bank and date across all records.
constexpr const char* kMigration2 = R"sql(
CREATE TABLE nom_currencies (
    ID GUID NOT NULL PRIMARY KEY,
    Code VARCHAR(10) NOT NULL UNIQUE,
    Name VARCHAR(100) NOT NULL UNIQUE,
    IsActive BOOLEAN NOT NULL DEFAULT 1,
    Note VARCHAR(255),
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME
);

CREATE TABLE nom_banks (
    ID GUID NOT NULL PRIMARY KEY,
    Name VARCHAR(100) NOT NULL UNIQUE,
    Description VARCHAR(255),
    GroupName VARCHAR(100),
    IsActive BOOLEAN NOT NULL DEFAULT 1,
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME
);

CREATE TABLE nom_currratios (
    ID GUID NOT NULL PRIMARY KEY,
    Date DATE NOT NULL,
    IsActive BOOLEAN NOT NULL DEFAULT 1,
    Pr_ID GUID NOT NULL REFERENCES nom_banks (ID),
    Note VARCHAR(255),
    NoteRtf LONGTEXT,
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME
);
CREATE INDEX ix_nom_currratios_bank ON nom_currratios (Pr_ID, Date);
CREATE INDEX ix_nom_currratios_date ON nom_currratios (Date);

CREATE TABLE nom_currratiosdetails (
    ID GUID NOT NULL PRIMARY KEY,
    CurrRatio_ID GUID NOT NULL REFERENCES nom_currratios (ID) ON DELETE CASCADE,
    Currency_ID GUID NOT NULL REFERENCES nom_currencies (ID),
    Pr_ID GUID NOT NULL REFERENCES nom_banks (ID),
    Date DATE NOT NULL,
    Units INTEGER NOT NULL DEFAULT 1 CHECK (Units > 0),
    Rate DECIMAL(18,6) NOT NULL CHECK (Rate > 0),
    UNIQUE (Pr_ID, Date, Currency_ID)
);
CREATE INDEX ix_nom_currratiosdetails_head ON nom_currratiosdetails (CurrRatio_ID);
CREATE INDEX ix_nom_currratiosdetails_currency ON nom_currratiosdetails (Currency_ID);
)sql";

// Items and what the items list shows beside them: measures and each item's
// ratios to its base measure, item types, dimensions and their values
// (categories), stores with the items' balances, price-list types with the
// prices of each type per item, currency and measure (optionally owned by a
// supplier), discount schemas, barcodes, supplier codes, related items, bills
// of materials and cost centres. The code lists of an item (`BarCodes`,
// `BarPrefixes`, `BarMeasures`, `SupplCodes`, `SupplMeasures`, `Categories`)
// are kept on the item by the service, each entry preceded by U+007F and the
// last followed by it, so that the list reads them without aggregating a
// million items' codes on every fetch.
constexpr const char* kMigration3 = R"sql(
CREATE TABLE nom_measures (
    ID GUID NOT NULL PRIMARY KEY,
    Code VARCHAR(20) NOT NULL UNIQUE,
    Name VARCHAR(100) NOT NULL UNIQUE,
    IsActive BOOLEAN NOT NULL DEFAULT 1,
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME
);

CREATE TABLE nom_itemtypes (
    ID GUID NOT NULL PRIMARY KEY,
    Name VARCHAR(100) NOT NULL UNIQUE,
    IsActive BOOLEAN NOT NULL DEFAULT 1
);

CREATE TABLE nom_dimensions (
    ID GUID NOT NULL PRIMARY KEY,
    Name VARCHAR(100) NOT NULL UNIQUE,
    IsActive BOOLEAN NOT NULL DEFAULT 1
);

CREATE TABLE nom_dimvalues (
    ID GUID NOT NULL PRIMARY KEY,
    Dimension_ID GUID NOT NULL REFERENCES nom_dimensions (ID) ON DELETE CASCADE,
    Name VARCHAR(100) NOT NULL,
    FullName VARCHAR(500) NOT NULL,
    IsActive BOOLEAN NOT NULL DEFAULT 1,
    UNIQUE (Dimension_ID, FullName)
);

CREATE TABLE nom_stores (
    ID GUID NOT NULL PRIMARY KEY,
    Code VARCHAR(20) NOT NULL UNIQUE,
    Name VARCHAR(100) NOT NULL UNIQUE,
    IsActive BOOLEAN NOT NULL DEFAULT 1
);

CREATE TABLE nom_costcenters (
    ID GUID NOT NULL PRIMARY KEY,
    Type INTEGER NOT NULL,
    Code VARCHAR(50) NOT NULL,
    Name VARCHAR(250) NOT NULL,
    Itm_ID GUID,
    IsActive BOOLEAN NOT NULL DEFAULT 1,
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME,
    UNIQUE (Type, Code)
);

CREATE TABLE nom_items (
    ID GUID NOT NULL PRIMARY KEY,
    Code VARCHAR(50) NOT NULL UNIQUE,
    Name VARCHAR(250) NOT NULL,
    Name2 VARCHAR(250),
    ItmType_ID GUID REFERENCES nom_itemtypes (ID),
    DimValue_ID GUID REFERENCES nom_dimvalues (ID),
    Measure_ID GUID NOT NULL REFERENCES nom_measures (ID),
    SecMeasure_ID GUID REFERENCES nom_measures (ID),
    DefCurrency_ID GUID REFERENCES nom_currencies (ID),
    IsVat BOOLEAN NOT NULL DEFAULT 1,
    IsVatAllowed BOOLEAN NOT NULL DEFAULT 1,
    Vat DECIMAL(9,4) NOT NULL,
    VatPriceScale INTEGER NOT NULL DEFAULT 2,
    MinOrderQuo DECIMAL(18,6),
    WeightBruto DECIMAL(18,6),
    WeightNeto DECIMAL(18,6),
    Excise DECIMAL(18,6),
    DutyTariffPrc DECIMAL(9,4),
    DutyTariffCode VARCHAR(20),
    Priority INTEGER,
    Intrastat VARCHAR(20),
    IsRatePrice BOOLEAN NOT NULL DEFAULT 0,
    RatePrice DECIMAL(18,8),
    IsDma BOOLEAN NOT NULL DEFAULT 0,
    IsAccPr BOOLEAN NOT NULL DEFAULT 0,
    IsAccQuo BOOLEAN NOT NULL DEFAULT 0,
    Permit VARCHAR(100),
    Concentration VARCHAR(50),
    MarginalPriceVat DECIMAL(18,8),
    PriceGroup VARCHAR(50),
    Shelves VARCHAR(100),
    BomCount INTEGER NOT NULL DEFAULT 0,
    ProjectCC_ID GUID REFERENCES nom_costcenters (ID) ON DELETE SET NULL,
    Categories TEXT,
    BarCodes TEXT,
    BarPrefixes TEXT,
    BarMeasures TEXT,
    SupplCodes TEXT,
    SupplMeasures TEXT,
    IsActive BOOLEAN NOT NULL DEFAULT 1,
    Note VARCHAR(255),
    NoteRtf LONGTEXT,
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME
);
CREATE INDEX ix_nom_items_name ON nom_items (Name);

CREATE TABLE nom_itemsmeasures (
    ID GUID NOT NULL PRIMARY KEY,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    Measure_ID GUID NOT NULL REFERENCES nom_measures (ID),
    Ratio DECIMAL(18,6) NOT NULL CHECK (Ratio > 0),
    UNIQUE (Itm_ID, Measure_ID)
);
CREATE INDEX ix_nom_itemsmeasures_read ON nom_itemsmeasures (Itm_ID, Measure_ID, Ratio);

CREATE TABLE nom_itemsbarcodes (
    ID GUID NOT NULL PRIMARY KEY,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    BarCode VARCHAR(50) NOT NULL,
    Measure_ID GUID REFERENCES nom_measures (ID)
);
CREATE INDEX ix_nom_itemsbarcodes_item ON nom_itemsbarcodes (Itm_ID);
CREATE INDEX ix_nom_itemsbarcodes_code ON nom_itemsbarcodes (BarCode);

CREATE TABLE nom_itemssupplcodes (
    ID GUID NOT NULL PRIMARY KEY,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    Cg_ID GUID,
    Code VARCHAR(50) NOT NULL,
    Measure_ID GUID REFERENCES nom_measures (ID)
);
CREATE INDEX ix_nom_itemssupplcodes_item ON nom_itemssupplcodes (Itm_ID);

CREATE TABLE nom_itemssimilar (
    ID GUID NOT NULL PRIMARY KEY,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    SimilarItm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    Type INTEGER NOT NULL CHECK (Type IN (1, 2)),
    UNIQUE (Itm_ID, SimilarItm_ID, Type)
);
CREATE INDEX ix_nom_itemssimilar_other ON nom_itemssimilar (SimilarItm_ID);

CREATE TABLE nom_itemsboms (
    ID GUID NOT NULL PRIMARY KEY,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    Component_ID GUID NOT NULL REFERENCES nom_items (ID),
    Quantity DECIMAL(18,6) NOT NULL CHECK (Quantity > 0)
);
CREATE INDEX ix_nom_itemsboms_item ON nom_itemsboms (Itm_ID);
CREATE INDEX ix_nom_itemsboms_component ON nom_itemsboms (Component_ID);

CREATE TABLE nom_pricelisttypes (
    ID GUID NOT NULL PRIMARY KEY,
    Code VARCHAR(20) NOT NULL UNIQUE,
    Name VARCHAR(100) NOT NULL UNIQUE,
    IsPromo BOOLEAN NOT NULL DEFAULT 0,
    IsActive BOOLEAN NOT NULL DEFAULT 1,
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME
);

CREATE TABLE nom_prices (
    ID GUID NOT NULL PRIMARY KEY,
    PlType_ID GUID NOT NULL REFERENCES nom_pricelisttypes (ID) ON DELETE CASCADE,
    Cg_ID GUID,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    Currency_ID GUID NOT NULL REFERENCES nom_currencies (ID),
    Measure_ID GUID NOT NULL REFERENCES nom_measures (ID),
    BasePrice DECIMAL(18,8) NOT NULL,
    BasePriceWithVat DECIMAL(18,8) NOT NULL,
    LD DATETIME
);
CREATE UNIQUE INDEX ux_nom_prices ON nom_prices (PlType_ID, Cg_ID, Itm_ID, Currency_ID, Measure_ID);
-- The prices of a type read in item order without visiting the table.
CREATE INDEX ix_nom_prices_read
    ON nom_prices (PlType_ID, Cg_ID, Itm_ID, Currency_ID, Measure_ID, BasePrice, BasePriceWithVat);
CREATE INDEX ix_nom_prices_item ON nom_prices (Itm_ID);

CREATE TABLE nom_storesaldo (
    ID GUID NOT NULL PRIMARY KEY,
    Store_ID GUID NOT NULL REFERENCES nom_stores (ID),
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    Quantity DECIMAL(18,6) NOT NULL,
    QuantityReserved DECIMAL(18,6) NOT NULL,
    QuantitySecMeasure DECIMAL(18,6),
    TotalSum DECIMAL(18,4) NOT NULL,
    MinQuantity DECIMAL(18,6),
    UNIQUE (Store_ID, Itm_ID)
);
-- A store's quantities (and every store's sums) in item order from the index.
CREATE INDEX ix_nom_storesaldo_read ON nom_storesaldo (Store_ID, Itm_ID, Quantity,
    QuantityReserved, QuantitySecMeasure, TotalSum, MinQuantity);
CREATE INDEX ix_nom_storesaldo_sums ON nom_storesaldo (Itm_ID, Quantity, QuantityReserved,
    QuantitySecMeasure, TotalSum, MinQuantity);

CREATE TABLE nom_discountschemas (
    ID GUID NOT NULL PRIMARY KEY,
    Name VARCHAR(100) NOT NULL UNIQUE,
    IsActive BOOLEAN NOT NULL DEFAULT 1
);

CREATE TABLE nom_discountitems (
    ID GUID NOT NULL PRIMARY KEY,
    Schema_ID GUID NOT NULL REFERENCES nom_discountschemas (ID) ON DELETE CASCADE,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    Discount DECIMAL(9,4) NOT NULL,
    UNIQUE (Schema_ID, Itm_ID)
);
CREATE INDEX ix_nom_discountitems_item ON nom_discountitems (Itm_ID);
)sql";

// Business partners with their persons, delivery addresses, bank accounts and
// departments, the partner types, and the dimensions of partners with their
// values. Price lists, discount schemes, bonus programmes, countries, cities
// and streets are referred to by key only (no foreign key), so that the
// tables that hold them may come in any order.
constexpr const char* kMigration4 = R"sql(
INSERT OR IGNORE INTO sys_settings (Name, Kind, Value) VALUES
    ('CgTypeNaturalPerson_ID', 'Guid', NULL),
    ('CgTypeEmployee_ID', 'Guid', NULL),
    ('CgTypeStore_ID', 'Guid', NULL);

CREATE TABLE nom_cgtypes (
    ID GUID NOT NULL PRIMARY KEY,
    Code VARCHAR(20) NOT NULL UNIQUE,
    Name VARCHAR(100) NOT NULL UNIQUE,
    IsDef BOOLEAN DEFAULT 0,
    IsActive BOOLEAN NOT NULL DEFAULT 1
);

CREATE TABLE nom_cgdimensions (
    ID GUID NOT NULL PRIMARY KEY,
    Code VARCHAR(20) NOT NULL UNIQUE,
    Name VARCHAR(100) NOT NULL UNIQUE,
    ValueType INTEGER NOT NULL DEFAULT 1 CHECK (ValueType IN (1, 7)),
    IsRequired BOOLEAN DEFAULT 0,
    IsActive BOOLEAN NOT NULL DEFAULT 1
);

CREATE TABLE nom_cgdimvalues (
    ID GUID NOT NULL PRIMARY KEY,
    Dimension_ID GUID NOT NULL REFERENCES nom_cgdimensions (ID) ON DELETE CASCADE,
    Code VARCHAR(20),
    Name VARCHAR(200) NOT NULL,
    IsActive BOOLEAN NOT NULL DEFAULT 1,
    UNIQUE (Dimension_ID, Name)
);

CREATE TABLE nom_contragents (
    ID GUID NOT NULL PRIMARY KEY,
    Code VARCHAR(20) NOT NULL UNIQUE,
    Name VARCHAR(200) NOT NULL UNIQUE,
    Address VARCHAR(255) NOT NULL,
    IsActive BOOLEAN NOT NULL DEFAULT 1,
    TaxNo VARCHAR(20),
    Bulstat VARCHAR(20),
    CgType_ID GUID NOT NULL REFERENCES nom_cgtypes (ID),
    PrsOsp_ID GUID,
    Note VARCHAR(1000),
    NoteRtf LONGTEXT,
    PriceList_ID GUID,
    Disc_ID GUID,
    Name2 VARCHAR(200),
    Phone VARCHAR(100),
    CreditLimitation DECIMAL(18,8),
    MaxDaysInArrears INTEGER,
    GlobalLocationNumber VARCHAR(20),
    DvskNo VARCHAR(50),
    Country_ID GUID,
    City_ID GUID,
    PostalCode VARCHAR(20),
    Street_ID GUID,
    StreetNo VARCHAR(20),
    BlockNo VARCHAR(20),
    Entrance VARCHAR(20),
    FloorNo VARCHAR(20),
    Apartment VARCHAR(20),
    Place VARCHAR(255),
    CorrespAddress VARCHAR(255),
    CorrespAddress2 VARCHAR(255),
    Fax VARCHAR(100),
    Email VARCHAR(255),
    WebAddress VARCHAR(255),
    Address2 VARCHAR(255),
    InvDaysPostponePmt INTEGER,
    SupDaysPostponePmt INTEGER,
    CgStoreMode INTEGER DEFAULT 0,
    SellEqualStoreQuantity BOOLEAN DEFAULT 0,
    MandatoryValidationRSD BOOLEAN DEFAULT 0,
    OwnPrsMol_ID GUID,
    WayOfPayment INTEGER DEFAULT 0,
    RequiredInvDoc INTEGER DEFAULT 0,
    InvCgOwn_ID GUID,
    CgForInvoice_ID GUID,
    IsDepRequired BOOLEAN DEFAULT 0,
    IsExcisePrintable BOOLEAN DEFAULT 0,
    License VARCHAR(100),
    LicenseMi VARCHAR(100),
    CcStruct_ID GUID,
    CcProject_ID GUID,
    CcOther_ID GUID,
    CustomPrintSettings BOOLEAN DEFAULT 0,
    Bonus_ID GUID,
    DeliveryAddress_ID GUID,
    PosCards VARCHAR(1000),
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME
);
CREATE INDEX ix_nom_contragents_type ON nom_contragents (CgType_ID);
CREATE INDEX ix_nom_contragents_bulstat ON nom_contragents (Bulstat);
CREATE INDEX ix_nom_contragents_taxno ON nom_contragents (TaxNo);

-- A person's code, a department's code and an account's IBAN with its BIC
-- are unique across all partners.
CREATE TABLE nom_cgpersons (
    ID GUID NOT NULL PRIMARY KEY,
    Cg_ID GUID NOT NULL REFERENCES nom_contragents (ID) ON DELETE CASCADE,
    Code VARCHAR(20) UNIQUE,
    Name VARCHAR(200) NOT NULL,
    Egn VARCHAR(20),
    IsActive BOOLEAN DEFAULT 1,
    IsMol BOOLEAN DEFAULT 0,
    IsOsp BOOLEAN DEFAULT 0,
    IsDefMol BOOLEAN DEFAULT 0,
    IsDefOsp BOOLEAN DEFAULT 0,
    IsContact BOOLEAN DEFAULT 0,
    PhoneWork VARCHAR(100),
    PhoneMobile VARCHAR(100),
    Email VARCHAR(255),
    EmailMode INTEGER DEFAULT 0,
    PosCard VARCHAR(50),
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME
);
CREATE INDEX ix_nom_cgpersons_cg ON nom_cgpersons (Cg_ID);

CREATE TABLE nom_cgaddresses (
    ID GUID NOT NULL PRIMARY KEY,
    Cg_ID GUID NOT NULL REFERENCES nom_contragents (ID) ON DELETE CASCADE,
    Name VARCHAR(255) NOT NULL,
    IsDefault BOOLEAN DEFAULT 0,
    Country_ID GUID,
    City_ID GUID,
    PostalCode VARCHAR(20),
    Street_ID GUID,
    StreetNo VARCHAR(20),
    BlockNo VARCHAR(20),
    Entrance VARCHAR(20),
    FloorNo VARCHAR(20),
    Apartment VARCHAR(20),
    Place VARCHAR(255)
);
CREATE INDEX ix_nom_cgaddresses_cg ON nom_cgaddresses (Cg_ID);

CREATE TABLE nom_cgbankaccounts (
    ID GUID NOT NULL PRIMARY KEY,
    Cg_ID GUID NOT NULL REFERENCES nom_contragents (ID) ON DELETE CASCADE,
    Name VARCHAR(200),
    AccountCode VARCHAR(50) NOT NULL,
    BankCode VARCHAR(20),
    CurrencyCode VARCHAR(10),
    UNIQUE (AccountCode, BankCode)
);
CREATE INDEX ix_nom_cgbankaccounts_cg ON nom_cgbankaccounts (Cg_ID);

CREATE TABLE nom_cgdepartments (
    ID GUID NOT NULL PRIMARY KEY,
    Cg_ID GUID NOT NULL REFERENCES nom_contragents (ID) ON DELETE CASCADE,
    Code VARCHAR(20) UNIQUE,
    Name VARCHAR(200) NOT NULL,
    Bulstat VARCHAR(20),
    Address VARCHAR(255),
    GlobalLocationNumber VARCHAR(20),
    Note VARCHAR(1000),
    Categories VARCHAR(255),
    CgStore_ID GUID,
    DeliveryAddress_ID GUID,
    BankAcc_ID GUID,
    PrsMol_ID GUID
);
CREATE INDEX ix_nom_cgdepartments_cg ON nom_cgdepartments (Cg_ID);

-- The dimension values of a partner: one row per value.
CREATE TABLE nom_cgdimlinks (
    ID GUID NOT NULL PRIMARY KEY,
    Cg_ID GUID NOT NULL REFERENCES nom_contragents (ID) ON DELETE CASCADE,
    Dimension_ID GUID NOT NULL REFERENCES nom_cgdimensions (ID),
    DimValue_ID GUID NOT NULL REFERENCES nom_cgdimvalues (ID),
    UNIQUE (Cg_ID, DimValue_ID)
);
CREATE INDEX ix_nom_cgdimlinks_value ON nom_cgdimlinks (DimValue_ID);
)sql";

// What the item's detail form keeps beyond the list: defaults of the
// reference lists, the scales, the default store, the VAT group and the
// settings a new item takes its values from.
constexpr const char* kMigration5 = R"sql(
ALTER TABLE nom_itemtypes ADD COLUMN IsDef BOOLEAN NOT NULL DEFAULT 0;
ALTER TABLE nom_itemtypes ADD COLUMN IsService BOOLEAN NOT NULL DEFAULT 0;
ALTER TABLE nom_measures ADD COLUMN IsDef BOOLEAN NOT NULL DEFAULT 0;
ALTER TABLE nom_dimensions ADD COLUMN ValueType INTEGER NOT NULL DEFAULT 1;
ALTER TABLE nom_dimensions ADD COLUMN IsRequired BOOLEAN NOT NULL DEFAULT 0;
ALTER TABLE nom_items ADD COLUMN IsService BOOLEAN NOT NULL DEFAULT 0;
ALTER TABLE nom_items ADD COLUMN CgStore_ID GUID REFERENCES nom_stores (ID);
ALTER TABLE nom_items ADD COLUMN SecMeasure2_ID GUID REFERENCES nom_measures (ID);
ALTER TABLE nom_items ADD COLUMN PriceScale INTEGER NOT NULL DEFAULT 2;
ALTER TABLE nom_items ADD COLUMN BasicMeasureScale INTEGER NOT NULL DEFAULT 0;
ALTER TABLE nom_items ADD COLUMN TaxGroup INTEGER NOT NULL DEFAULT 2;
ALTER TABLE nom_items ADD COLUMN FinStruct_ID GUID;

INSERT INTO sys_settings (Name, Kind, Value) VALUES
    ('DefCgStore_ID', 'Guid', NULL),
    ('DefItmDimension_ID', 'Guid', NULL),
    ('Vat', 'Decimal', '20'),
    ('DefPriceScale', 'Long', '2');
)sql";

// Everything the item's detail form edits: the remaining attributes of an
// item, the sub-lists kept with it (supplier prices share the price table
// under the supplier price-list type), bills of materials with their rows,
// lots, the reference lists behind the form's lists, and the settings of
// generated price lists: a generated type takes its prices from a parent
// type (or, for the last delivery price, from the supplier type) with a
// mark-up per item, per dimension value or for everything, and rounds them.
// Optional links are set to NULL when what they point to goes; the links of
// an item to other items and partners are indexed only where they are set.
constexpr const char* kMigration6 = R"sql(
CREATE TABLE nom_dutytariffs (
    ID GUID NOT NULL PRIMARY KEY,
    Code VARCHAR(20) NOT NULL UNIQUE,
    Name VARCHAR(200) NOT NULL,
    DutyTariffPrc DECIMAL(9,4) NOT NULL DEFAULT 0,
    IsActive BOOLEAN NOT NULL DEFAULT 1,
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME
);

-- Financial directions: a tree; items take only leaves.
CREATE TABLE nom_finstruct (
    ID GUID NOT NULL PRIMARY KEY,
    P_ID GUID REFERENCES nom_finstruct (ID) ON DELETE CASCADE,
    Code VARCHAR(20) NOT NULL UNIQUE,
    Name VARCHAR(200) NOT NULL,
    IsActive BOOLEAN NOT NULL DEFAULT 1
);
CREATE INDEX ix_nom_finstruct_parent ON nom_finstruct (P_ID);

CREATE TABLE nom_intrastat (
    ID GUID NOT NULL PRIMARY KEY,
    Code VARCHAR(20) NOT NULL UNIQUE,
    Name VARCHAR(500) NOT NULL,
    IsDefault BOOLEAN NOT NULL DEFAULT 0,
    IsActive BOOLEAN NOT NULL DEFAULT 1
);

CREATE TABLE nom_shelves (
    ID GUID NOT NULL PRIMARY KEY,
    Code VARCHAR(20) NOT NULL UNIQUE,
    Name VARCHAR(100) NOT NULL,
    Store_ID GUID REFERENCES nom_stores (ID) ON DELETE SET NULL,
    IsActive BOOLEAN NOT NULL DEFAULT 1
);

-- How a formed price is rounded: steps of `Modulo` units of the last decimal
-- of the price scale (1/-Modulo of a unit when negative), ending in
-- `Reminder`; `Direction` 1 up, 2 down, 3 to the nearest; `IsVatIncluded`
-- rounds the price with VAT.
CREATE TABLE nom_roundtypes (
    ID GUID NOT NULL PRIMARY KEY,
    Name VARCHAR(100) NOT NULL UNIQUE,
    Modulo INTEGER NOT NULL DEFAULT 0,
    Reminder INTEGER NOT NULL DEFAULT 0,
    Direction INTEGER NOT NULL DEFAULT 1 CHECK (Direction IN (1, 2, 3)),
    IsVatIncluded BOOLEAN NOT NULL DEFAULT 0,
    IsDefault BOOLEAN NOT NULL DEFAULT 0,
    IsActive BOOLEAN NOT NULL DEFAULT 1
);

ALTER TABLE nom_pricelisttypes ADD COLUMN IsAutoGener BOOLEAN NOT NULL DEFAULT 0;
ALTER TABLE nom_pricelisttypes ADD COLUMN PriceFormType INTEGER NOT NULL DEFAULT 1
    CHECK (PriceFormType IN (1, 2, 3));
ALTER TABLE nom_pricelisttypes ADD COLUMN ParentPlType_ID GUID
    REFERENCES nom_pricelisttypes (ID) ON DELETE SET NULL;
ALTER TABLE nom_pricelisttypes ADD COLUMN CgStore_ID GUID
    REFERENCES nom_stores (ID) ON DELETE SET NULL;
ALTER TABLE nom_pricelisttypes ADD COLUMN RoundType_ID GUID
    REFERENCES nom_roundtypes (ID) ON DELETE SET NULL;
ALTER TABLE nom_pricelisttypes ADD COLUMN Dimension_ID GUID
    REFERENCES nom_dimensions (ID) ON DELETE SET NULL;

-- Mark-ups of a price-list type: per dimension value (none: everything) and
-- per item and measure.
CREATE TABLE nom_pricelistdimvalues (
    ID GUID NOT NULL PRIMARY KEY,
    PriceListType_ID GUID NOT NULL REFERENCES nom_pricelisttypes (ID) ON DELETE CASCADE,
    ListValue_ID GUID REFERENCES nom_dimvalues (ID) ON DELETE CASCADE,
    CoefficientA DECIMAL(18,8) NOT NULL DEFAULT 0,
    CoefficientB DECIMAL(18,8) NOT NULL DEFAULT 0,
    IsActive BOOLEAN NOT NULL DEFAULT 1,
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME,
    UNIQUE (PriceListType_ID, ListValue_ID)
);
CREATE INDEX ix_nom_pricelistdimvalues_value ON nom_pricelistdimvalues (ListValue_ID);

CREATE TABLE nom_pricelistitems (
    ID GUID NOT NULL PRIMARY KEY,
    PriceListType_ID GUID NOT NULL REFERENCES nom_pricelisttypes (ID) ON DELETE CASCADE,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    Measure_ID GUID NOT NULL REFERENCES nom_measures (ID),
    CoefficientA DECIMAL(18,8) NOT NULL DEFAULT 0,
    CoefficientB DECIMAL(18,8) NOT NULL DEFAULT 0,
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME,
    UNIQUE (PriceListType_ID, Itm_ID, Measure_ID)
);
CREATE INDEX ix_nom_pricelistitems_item ON nom_pricelistitems (Itm_ID);

-- The remaining attributes of an item.
ALTER TABLE nom_items ADD COLUMN PriceMake INTEGER NOT NULL DEFAULT 0
    CHECK (PriceMake IN (0, 1, 2));
ALTER TABLE nom_items ADD COLUMN VolumeNeto DECIMAL(18,6);
ALTER TABLE nom_items ADD COLUMN VolumeBruto DECIMAL(18,6);
ALTER TABLE nom_items ADD COLUMN SecItm_ID GUID REFERENCES nom_items (ID) ON DELETE SET NULL;
ALTER TABLE nom_items ADD COLUMN AccItm_ID GUID REFERENCES nom_items (ID) ON DELETE SET NULL;
ALTER TABLE nom_items ADD COLUMN WarrantyPeriod INTEGER;
ALTER TABLE nom_items ADD COLUMN WarrantyMeasure INTEGER NOT NULL DEFAULT 0
    CHECK (WarrantyMeasure IN (0, 1));
ALTER TABLE nom_items ADD COLUMN LifePeriod INTEGER;
ALTER TABLE nom_items ADD COLUMN LifeMeasure INTEGER NOT NULL DEFAULT 0
    CHECK (LifeMeasure IN (0, 1));
ALTER TABLE nom_items ADD COLUMN ProducerCg_ID GUID
    REFERENCES nom_contragents (ID) ON DELETE SET NULL;
ALTER TABLE nom_items ADD COLUMN ImporterCg_ID GUID
    REFERENCES nom_contragents (ID) ON DELETE SET NULL;
ALTER TABLE nom_items ADD COLUMN Ecotax DECIMAL(18,8);
ALTER TABLE nom_items ADD COLUMN DutyTariff_id GUID
    REFERENCES nom_dutytariffs (ID) ON DELETE SET NULL;
ALTER TABLE nom_items ADD COLUMN Intrastat_ID GUID
    REFERENCES nom_intrastat (ID) ON DELETE SET NULL;
ALTER TABLE nom_items ADD COLUMN IntrAddMeasure_ID GUID
    REFERENCES nom_measures (ID) ON DELETE SET NULL;
ALTER TABLE nom_items ADD COLUMN RowsumPrintOnly BOOLEAN NOT NULL DEFAULT 0;
ALTER TABLE nom_items ADD COLUMN DefaultLot VARCHAR(50);
ALTER TABLE nom_items ADD COLUMN DefaultClass VARCHAR(50);
ALTER TABLE nom_items ADD COLUMN OperatingDetails VARCHAR(1000);
ALTER TABLE nom_items ADD COLUMN LabelText VARCHAR(1000);
ALTER TABLE nom_items ADD COLUMN Description VARCHAR(1000);
ALTER TABLE nom_items ADD COLUMN Kind VARCHAR(100);
ALTER TABLE nom_items ADD COLUMN Kind2 VARCHAR(100);
ALTER TABLE nom_items ADD COLUMN Caliber VARCHAR(100);
ALTER TABLE nom_items ADD COLUMN Caliber2 VARCHAR(100);
ALTER TABLE nom_items ADD COLUMN Origin VARCHAR(100);
ALTER TABLE nom_items ADD COLUMN Origin2 VARCHAR(100);
ALTER TABLE nom_items ADD COLUMN Packing VARCHAR(100);
ALTER TABLE nom_items ADD COLUMN Packing2 VARCHAR(100);
ALTER TABLE nom_items ADD COLUMN CcStruct_ID GUID
    REFERENCES nom_costcenters (ID) ON DELETE SET NULL;
ALTER TABLE nom_items ADD COLUMN CcOther_ID GUID
    REFERENCES nom_costcenters (ID) ON DELETE SET NULL;
ALTER TABLE nom_items ADD COLUMN IsLotRequired BOOLEAN NOT NULL DEFAULT 0;
ALTER TABLE nom_items ADD COLUMN IsPacking BOOLEAN NOT NULL DEFAULT 0;
ALTER TABLE nom_items ADD COLUMN VariantParentItm_ID GUID
    REFERENCES nom_items (ID) ON DELETE SET NULL;
CREATE INDEX ix_nom_items_secitm ON nom_items (SecItm_ID) WHERE SecItm_ID IS NOT NULL;
CREATE INDEX ix_nom_items_accitm ON nom_items (AccItm_ID) WHERE AccItm_ID IS NOT NULL;
CREATE INDEX ix_nom_items_variant ON nom_items (VariantParentItm_ID)
    WHERE VariantParentItm_ID IS NOT NULL;
CREATE INDEX ix_nom_items_producer ON nom_items (ProducerCg_ID) WHERE ProducerCg_ID IS NOT NULL;
CREATE INDEX ix_nom_items_importer ON nom_items (ImporterCg_ID) WHERE ImporterCg_ID IS NOT NULL;
CREATE INDEX ix_nom_items_dutytariff ON nom_items (DutyTariff_id) WHERE DutyTariff_id IS NOT NULL;
CREATE INDEX ix_nom_items_intrastat ON nom_items (Intrastat_ID) WHERE Intrastat_ID IS NOT NULL;
CREATE INDEX ix_nom_items_intrmeasure ON nom_items (IntrAddMeasure_ID)
    WHERE IntrAddMeasure_ID IS NOT NULL;
CREATE INDEX ix_nom_items_ccstruct ON nom_items (CcStruct_ID) WHERE CcStruct_ID IS NOT NULL;
CREATE INDEX ix_nom_items_ccother ON nom_items (CcOther_ID) WHERE CcOther_ID IS NOT NULL;
CREATE INDEX ix_nom_items_ccproject ON nom_items (ProjectCC_ID) WHERE ProjectCC_ID IS NOT NULL;

-- Prices: a row's currency rate, whether the price includes VAT, a note and
-- whether it was generated. Supplier prices are the rows of the supplier
-- price-list type (the setting SupplPriceList_ID), owned by the supplier.
ALTER TABLE nom_prices ADD COLUMN Rate DECIMAL(18,6);
ALTER TABLE nom_prices ADD COLUMN IsVat BOOLEAN;
ALTER TABLE nom_prices ADD COLUMN Note VARCHAR(255);
ALTER TABLE nom_prices ADD COLUMN IsAutoGener BOOLEAN;
ALTER TABLE nom_prices ADD COLUMN CU GUID REFERENCES sec_users (ID);
ALTER TABLE nom_prices ADD COLUMN CD DATETIME;
ALTER TABLE nom_prices ADD COLUMN LU GUID REFERENCES sec_users (ID);

-- Measure facets: `RatioPerUnits` of the measure equal `RatioCoeff` of the
-- base measure; `Ratio` (base measures per unit, what the list reads) is kept
-- as RatioCoeff / RatioPerUnits by the service.
ALTER TABLE nom_itemsmeasures ADD COLUMN RatioPerUnits DECIMAL(18,6) CHECK (RatioPerUnits > 0);
ALTER TABLE nom_itemsmeasures ADD COLUMN RatioCoeff DECIMAL(18,6) CHECK (RatioCoeff > 0);
ALTER TABLE nom_itemsmeasures ADD COLUMN Note VARCHAR(255);
ALTER TABLE nom_itemsmeasures ADD COLUMN CU GUID REFERENCES sec_users (ID);
ALTER TABLE nom_itemsmeasures ADD COLUMN CD DATETIME;
ALTER TABLE nom_itemsmeasures ADD COLUMN LU GUID REFERENCES sec_users (ID);
ALTER TABLE nom_itemsmeasures ADD COLUMN LD DATETIME;
UPDATE nom_itemsmeasures SET RatioPerUnits = 1000000, RatioCoeff = Ratio;

-- Barcodes: `Type` 0 (Auto), 1 EAN-13, 2 EAN-8, 3 EAN-128, 4 UPC-A, 5 UPC-E,
-- -1 a weight-barcode template.
ALTER TABLE nom_itemsbarcodes ADD COLUMN Note VARCHAR(255);
ALTER TABLE nom_itemsbarcodes ADD COLUMN IsDef BOOLEAN;
ALTER TABLE nom_itemsbarcodes ADD COLUMN Type INTEGER NOT NULL DEFAULT 0
    CHECK (Type BETWEEN -1 AND 5);
ALTER TABLE nom_itemsbarcodes ADD COLUMN CU GUID REFERENCES sec_users (ID);
ALTER TABLE nom_itemsbarcodes ADD COLUMN CD DATETIME;
ALTER TABLE nom_itemsbarcodes ADD COLUMN LU GUID REFERENCES sec_users (ID);
ALTER TABLE nom_itemsbarcodes ADD COLUMN LD DATETIME;
UPDATE nom_itemsbarcodes SET Type = -1
    WHERE BarCode NOT GLOB '*[^0-9wldc.]*' AND BarCode GLOB '*[wldc.]*';

ALTER TABLE nom_itemssupplcodes ADD COLUMN Name VARCHAR(250);
ALTER TABLE nom_itemssupplcodes ADD COLUMN CU GUID REFERENCES sec_users (ID);
ALTER TABLE nom_itemssupplcodes ADD COLUMN CD DATETIME;
ALTER TABLE nom_itemssupplcodes ADD COLUMN LU GUID REFERENCES sec_users (ID);
ALTER TABLE nom_itemssupplcodes ADD COLUMN LD DATETIME;

-- Related items: a weight (relevance), a note and whether the link is active.
ALTER TABLE nom_itemssimilar ADD COLUMN LnkWeight INTEGER;
ALTER TABLE nom_itemssimilar ADD COLUMN Note VARCHAR(255);
ALTER TABLE nom_itemssimilar ADD COLUMN IsActive BOOLEAN NOT NULL DEFAULT 1;
ALTER TABLE nom_itemssimilar ADD COLUMN CU GUID REFERENCES sec_users (ID);
ALTER TABLE nom_itemssimilar ADD COLUMN CD DATETIME;
ALTER TABLE nom_itemssimilar ADD COLUMN LU GUID REFERENCES sec_users (ID);
ALTER TABLE nom_itemssimilar ADD COLUMN LD DATETIME;

-- The parts of a composite item.
ALTER TABLE nom_itemsboms ADD COLUMN SeqNo INTEGER;
ALTER TABLE nom_itemsboms ADD COLUMN Measure_ID GUID REFERENCES nom_measures (ID);
ALTER TABLE nom_itemsboms ADD COLUMN GroupName VARCHAR(100);
ALTER TABLE nom_itemsboms ADD COLUMN CU GUID REFERENCES sec_users (ID);
ALTER TABLE nom_itemsboms ADD COLUMN CD DATETIME;
ALTER TABLE nom_itemsboms ADD COLUMN LU GUID REFERENCES sec_users (ID);
ALTER TABLE nom_itemsboms ADD COLUMN LD DATETIME;

-- The item's values of dimensions other than its group (the group is
-- nom_items.DimValue_ID).
CREATE TABLE nom_itemsdimvalues (
    ID GUID NOT NULL PRIMARY KEY,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    Dimension_ID GUID NOT NULL REFERENCES nom_dimensions (ID) ON DELETE CASCADE,
    ListValue_ID GUID NOT NULL REFERENCES nom_dimvalues (ID) ON DELETE CASCADE,
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME,
    UNIQUE (Itm_ID, ListValue_ID)
);
CREATE INDEX ix_nom_itemsdimvalues_value ON nom_itemsdimvalues (ListValue_ID);
CREATE INDEX ix_nom_itemsdimvalues_dimension ON nom_itemsdimvalues (Dimension_ID);

CREATE TABLE nom_itemsrateprices (
    ID GUID NOT NULL PRIMARY KEY,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    Cg_ID GUID NOT NULL REFERENCES nom_contragents (ID),
    RatePrice DECIMAL(18,8) NOT NULL,
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME
);
CREATE INDEX ix_nom_itemsrateprices_item ON nom_itemsrateprices (Itm_ID);
CREATE INDEX ix_nom_itemsrateprices_cg ON nom_itemsrateprices (Cg_ID);

CREATE TABLE nom_itemsminquo (
    ID GUID NOT NULL PRIMARY KEY,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    CgStore_ID GUID NOT NULL REFERENCES nom_stores (ID),
    MinQuantity DECIMAL(18,6) NOT NULL,
    MaxQuantity DECIMAL(18,6) NOT NULL,
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME,
    UNIQUE (Itm_ID, CgStore_ID)
);

CREATE TABLE nom_itemsshelves (
    ID GUID NOT NULL PRIMARY KEY,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    Shelf_ID GUID NOT NULL REFERENCES nom_shelves (ID) ON DELETE CASCADE,
    SeqNo INTEGER,
    Note VARCHAR(255),
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME
);
CREATE INDEX ix_nom_itemsshelves_item ON nom_itemsshelves (Itm_ID);
CREATE INDEX ix_nom_itemsshelves_shelf ON nom_itemsshelves (Shelf_ID);

-- Files attached from the media library, which keeps the files themselves.
CREATE TABLE nom_itemsattachments (
    ID GUID NOT NULL PRIMARY KEY,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    SeqNo INTEGER,
    MediaFileUrl VARCHAR(1000),
    MediaFile_ID GUID,
    MediaFileName VARCHAR(255),
    FolderName VARCHAR(255),
    MediaThumbData BLOB,
    Note VARCHAR(255),
    IsDef BOOLEAN,
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME
);
CREATE INDEX ix_nom_itemsattachments_item ON nom_itemsattachments (Itm_ID);

-- Rights of security groups on one item (bits of the framework's
-- permission editor).
CREATE TABLE nom_itemspermissions (
    ID GUID NOT NULL PRIMARY KEY,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    Group_ID GUID NOT NULL REFERENCES sec_groups (ID) ON DELETE CASCADE,
    AllowPerm INTEGER NOT NULL DEFAULT 0,
    DenyPerm INTEGER NOT NULL DEFAULT 0,
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME,
    UNIQUE (Itm_ID, Group_ID)
);
CREATE INDEX ix_nom_itemspermissions_group ON nom_itemspermissions (Group_ID);

CREATE TABLE nom_itemsactivities (
    ID GUID NOT NULL PRIMARY KEY,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    RowNo INTEGER,
    Process VARCHAR(100),
    Activity_ID GUID,
    Description VARCHAR(1000),
    PlanTime DECIMAL(18,6),
    Price DECIMAL(18,8),
    CcStruct_ID GUID REFERENCES nom_costcenters (ID) ON DELETE SET NULL,
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME
);
CREATE INDEX ix_nom_itemsactivities_item ON nom_itemsactivities (Itm_ID);
CREATE INDEX ix_nom_itemsactivities_cc ON nom_itemsactivities (CcStruct_ID)
    WHERE CcStruct_ID IS NOT NULL;

CREATE TABLE nom_itemsprefsuppl (
    ID GUID NOT NULL PRIMARY KEY,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    SeqNo INTEGER,
    Cg_ID GUID NOT NULL REFERENCES nom_contragents (ID),
    MinQuantity DECIMAL(18,6),
    StepQuantity DECIMAL(18,6),
    Measure_ID GUID NOT NULL REFERENCES nom_measures (ID),
    Note VARCHAR(255),
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME,
    UNIQUE (Itm_ID, Cg_ID, Measure_ID)
);
CREATE INDEX ix_nom_itemsprefsuppl_cg ON nom_itemsprefsuppl (Cg_ID);

-- The dimensions by which the variants of a main variant are shown
-- (`DimensionView` 1 to 8).
CREATE TABLE nom_itemsvariantdef (
    ID GUID NOT NULL PRIMARY KEY,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    SeqNo INTEGER,
    Dimension_ID GUID NOT NULL REFERENCES nom_dimensions (ID) ON DELETE CASCADE,
    DimensionView INTEGER NOT NULL DEFAULT 1 CHECK (DimensionView BETWEEN 1 AND 8),
    Note VARCHAR(255),
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME
);
CREATE INDEX ix_nom_itemsvariantdef_item ON nom_itemsvariantdef (Itm_ID);
CREATE INDEX ix_nom_itemsvariantdef_dimension ON nom_itemsvariantdef (Dimension_ID);

-- Bills of materials (recipes) of an item: `Quantity` of the item is made
-- of the rows; `NumRows` and the totals are kept by the service. A row's
-- `Itm_ID` is its component.
CREATE TABLE nom_boms (
    ID GUID NOT NULL PRIMARY KEY,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    Name VARCHAR(100) NOT NULL,
    IsActive BOOLEAN NOT NULL DEFAULT 1,
    IsDefault BOOLEAN NOT NULL DEFAULT 0,
    Quantity DECIMAL(18,6) NOT NULL DEFAULT 1000000 CHECK (Quantity > 0),
    NumRows INTEGER NOT NULL DEFAULT 0,
    TotalSum DECIMAL(18,8),
    TotalWithVat DECIMAL(18,8),
    Note VARCHAR(255),
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME,
    UNIQUE (Itm_ID, Name)
);

CREATE TABLE nom_bomsdetails (
    ID GUID NOT NULL PRIMARY KEY,
    Bom_ID GUID NOT NULL REFERENCES nom_boms (ID) ON DELETE CASCADE,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID),
    RowNo INTEGER,
    Measure_ID GUID REFERENCES nom_measures (ID),
    UnitQuantity DECIMAL(18,6),
    UnitSum DECIMAL(18,8),
    Quantity DECIMAL(18,6),
    Price DECIMAL(18,8),
    TotalSum DECIMAL(18,8),
    PriceWithVat DECIMAL(18,8),
    TotalWithVat DECIMAL(18,8),
    Note VARCHAR(255),
    SupplPriceLastDate DATE,
    CU GUID REFERENCES sec_users (ID),
    CD DATETIME,
    LU GUID REFERENCES sec_users (ID),
    LD DATETIME
);
CREATE INDEX ix_nom_bomsdetails_bom ON nom_bomsdetails (Bom_ID, RowNo);
CREATE INDEX ix_nom_bomsdetails_item ON nom_bomsdetails (Itm_ID);

-- Lots of an item in a store: the quantity of the lot and its weighted
-- average prices (the current one and the last one before it that was not
-- zero), in the lot's currency (the national one when empty).
CREATE TABLE nom_itemlots (
    ID GUID NOT NULL PRIMARY KEY,
    Itm_ID GUID NOT NULL REFERENCES nom_items (ID) ON DELETE CASCADE,
    Store_ID GUID NOT NULL REFERENCES nom_stores (ID),
    Lot VARCHAR(50) NOT NULL,
    VendorLot VARCHAR(50),
    ExpiryDate DATE,
    DeliveryDate DATE,
    OriginCountryName VARCHAR(100),
    Quantity DECIMAL(18,6) NOT NULL DEFAULT 0,
    PriceAvg DECIMAL(18,8),
    PriceAvgPrev DECIMAL(18,8),
    Currency_ID GUID REFERENCES nom_currencies (ID) ON DELETE SET NULL,
    UNIQUE (Itm_ID, Store_ID, Lot)
);
CREATE INDEX ix_nom_itemlots_store ON nom_itemlots (Store_ID);

-- The count of bills of materials of each item.
UPDATE nom_items SET BomCount = 0 WHERE BomCount <> 0;

INSERT OR IGNORE INTO sys_settings (Name, Kind, Value) VALUES
    ('SupplPriceList_ID', 'Guid', NULL);
)sql";

constexpr Migration kMigrations[] = {
    {1, "users, groups, rights and settings", kMigration1},
    {2, "currencies, banks and currency rates", kMigration2},
    {3, "items, measures, stores, price lists, balances and discounts", kMigration3},
    {4, "business partners", kMigration4},
    {5, "item details: defaults, scales and store", kMigration5},
    {6, "item details: every attribute and sub-list, bills of materials, lots, generated prices",
     kMigration6},
};

int currentVersion(Database& db) {
    auto st = db.prepare(
        "SELECT COUNT(*) FROM sqlite_schema WHERE type = 'table' AND name = 'sys_migrations'");
    st->step();
    if (st->int64(0) == 0) return 0;
    auto v = db.prepare("SELECT COALESCE(MAX(Version), 0) FROM sys_migrations");
    v->step();
    return static_cast<int>(v->int64(0));
}

}  // namespace

int schemaVersion() {
    return std::span(kMigrations).back().version;
}

static void migrate(Database& db) {
    db.begin(true);
    try {
        db.execute(
            "CREATE TABLE IF NOT EXISTS sys_migrations (Version INTEGER NOT NULL PRIMARY KEY, "
            "Name VARCHAR(200) NOT NULL, AppliedOn DATETIME NOT NULL)");
        db.commit();
    } catch (...) {
        db.rollback();
        throw;
    }
    for (const Migration& m : kMigrations) {
        Transaction tx(db, true);
        // Checked inside the write lock: another process may have applied it.
        int have = currentVersion(db);
        if (have > schemaVersion())
            raise(errc::Fail,
                  "The database is of schema version " + std::to_string(have) +
                      ", newer than this program knows (" + std::to_string(schemaVersion()) + ")",
                  "Database");
        // Each version is looked up by itself: a version numbered below one
        // already applied (branches merged in another order) still runs.
        auto applied = db.prepare("SELECT 1 FROM sys_migrations WHERE Version = ?1");
        applied->bind(1, Variant(m.version));
        if (applied->step()) continue;
        applied.reset();
        db.execute(m.sql);
        auto st =
            db.prepare("INSERT INTO sys_migrations (Version, Name, AppliedOn) VALUES (?1, ?2, ?3)");
        st->bind(1, Variant(m.version));
        st->bind(2, Variant(m.name));
        st->bind(3, Variant(now()));
        st->step();
        tx.commit();
    }
}

std::unique_ptr<Database> openDatabase(const std::string& path) {
    auto db = openSqlite(path);
    migrate(*db);
    return db;
}

}  // namespace pelta::bll
