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

constexpr Migration kMigrations[] = {
    {1, "users, groups, rights and settings", kMigration1},
    {2, "currencies, banks and currency rates", kMigration2},
    {3, "items, measures, stores, price lists, balances and discounts", kMigration3},
    {4, "business partners", kMigration4},
    {5, "item details: defaults, scales and store", kMigration5},
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
