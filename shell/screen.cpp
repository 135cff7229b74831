#include "shell/screen.h"

#include "platform/automation/error.h"

namespace pelta::shell {

namespace {
[[noreturn]] void notEditable(const std::string& grid) {
    pelta::raise(pelta::errc::InvalidProcedureCall, "The grid " + grid + " cannot be edited",
                 "pelta.shell");
}
}  // namespace

std::string Screen::addRow(const std::string& grid) {
    notEditable(grid);
}

bool Screen::editCell(const std::string& grid, const std::string&, const std::string&,
                      const Variant&) {
    notEditable(grid);
}

void Screen::setGroup(const std::string& grid, const std::string&) {
    pelta::raise(pelta::errc::InvalidProcedureCall, "The grid " + grid + " has no groups",
                 "pelta.shell");
}

void Screen::setFilter(const std::string& grid, int32_t, const std::string&) {
    pelta::raise(pelta::errc::InvalidProcedureCall, "The grid " + grid + " has no quick filter",
                 "pelta.shell");
}

namespace {
[[noreturn]] void noAttributes(const std::string& grid) {
    pelta::raise(pelta::errc::InvalidProcedureCall, "No attribute grid " + grid, "pelta.shell");
}
}  // namespace

bool Screen::setAttribute(const std::string& grid, const std::string&, const Variant&) {
    noAttributes(grid);
}

void Screen::attributeButton(const std::string& grid, const std::string&) {
    noAttributes(grid);
}

void Screen::selectAttribute(const std::string& grid, const std::string&) {
    noAttributes(grid);
}

bool Screen::chooseRow(const std::string& grid, const std::string&) {
    notEditable(grid);
}

bool Screen::activateNode(const std::string& tree, const std::string&) {
    pelta::raise(pelta::errc::InvalidProcedureCall, "No tree " + tree, "pelta.shell");
}

}  // namespace pelta::shell
