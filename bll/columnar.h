// Large lists read straight into the byte form of a recordset. A query's
// rows are gathered column by column as the recordset keeps them and written
// as its persisted form ("Recordset", see platform/data/recordset_io.cpp), so
// a million rows reach the client's recordset without a value object per
// cell on the way. Each column's storage is released once written.
#pragma once

#include <span>
#include <string_view>
#include <vector>

#include "bll/database.h"
#include "platform/data/bytes.h"

namespace pelta::bll {

class ColumnarRows final : public Persistable {
public:
    // Runs `sql` with `params` bound by position. Field types as readRecordset
    // gives them: the declared column types, `fields` for expressions.
    static Ref<ColumnarRows> read(Database& db, std::string_view sql,
                                  std::span<const Variant> params = {},
                                  std::span<const FieldDef> fields = {});
    ~ColumnarRows() override;

    size_t rowCount() const noexcept;
    std::string_view persistTag() const override { return "Recordset"; }
    // Written once: the columns are released as they are written, and a
    // second write raises InvalidProcedureCall.
    void persist(ByteWriter& w) const override;

    ColumnarRows();

private:
    struct Column;
    std::vector<Column>* columns_;
    size_t rows_ = 0;
    mutable bool written_ = false;
};

}  // namespace pelta::bll
