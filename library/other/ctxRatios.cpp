#include "library/other/ctxRatios.h"

#include "library/contracts/Constants.h"
#include "library/frame/Declarations.h"

namespace PeltaNom15 {

namespace {

ListDefinition RatiosList() {
    ListDefinition d;
    d.Caption = "Валутни курсове";
    d.ObjectName = "ctxRatios";
    d.FormHelpID = 2121;
    d.GridHelpID = 2123;
    d.GridLayoutKey = "{E604AA9E-3601-4FDE-93D8-86CFC5920C47}";
    d.DetailLayoutKey = "{687449F9-346A-40D3-B676-908472759566}";
    d.ReadOperation = "GetNomCurrRatios";
    d.DeleteOperation = "DelNomCurrRatios";
    d.DetailFormClass = "frmRatiosDetails";
    d.GroupColumn = "PrName";
    d.RemovedCommands = {502, 202, 204, 304, 506, 103, 201};
    d.Commands = {
        {kCmdNew, "Нов валутен курс...\tCtrl+N", "Нов валутен курс (Ctrl+N)"},
        {kCmdOpen, "Редакция валутен курс...\tCtrl+O", "Редакция на валутен курс (Ctrl+O)"},
        {kCmdDeleteInactive, {}, "Изтриване на неактивен валутен курс (Del)"},
    };
    d.Columns = {
        Bound("Date", "Дата", true, "dd.mm.yyyy"),
        Bound("PrName", "Банка"),
        Bound("IsActive", "Активен"),
        Bound("Note", "Забележка"),
        Bound("ID", "ID", false),
        Bound("Pr_ID", "Pr_ID", false),
        Bound("CU", "CU", false),
        Bound("CD", "CD", false),
        Bound("LU", "LU", false),
        Bound("LD", "LD", false),
    };
    return d;
}

}  // namespace

ctxRatios::ctxRatios() : cListFrame(RatiosList()) {}

}  // namespace PeltaNom15
