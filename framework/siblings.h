// Stand-ins of the suite's sibling libraries that the library reaches by
// programmatic identifier: they take every call, answer success and record
// what they were asked, so that a host or a test can see what a screen did
// with them.
#pragma once

#include <string>
#include <vector>

#include "library/contracts/Public.h"
#include "platform/automation/object.h"

namespace pelta::fw {

// One call a stand-in received.
struct SiblingCall {
    std::string progId;
    std::string member;
    std::vector<pelta::Variant> args;
};

// Every call received by any stand-in since the last clear, in order.
std::vector<SiblingCall> siblingCalls();
void clearSiblingCalls();

// A form of another library ("PeltaDma15.frmDmaDetails"): any late-bound
// member is recorded and answers True.
class SiblingForm : public pelta::Object {
public:
    explicit SiblingForm(std::string progId) : progId_(std::move(progId)) {}
    pelta::Variant invoke(std::string_view member, pelta::CallKind kind,
                          std::span<pelta::Variant> args) override;
    std::string typeName() const override;

private:
    std::string progId_;
};

// A report of another library ("PeltaTrade15.cRepStoLedgerItem"): records its
// initialisation, the presets of its filter fields (late-bound
// "PresetFilter") and ShowReport.
class SiblingReport : public PeltaNom15::IZonReport {
public:
    explicit SiblingReport(std::string progId) : progId_(std::move(progId)) {}
    bool InitClientSite(PeltaNom15::IClientSite* Site) override;
    bool ShowReport(const pelta::Variant& Params) override;
    pelta::Variant invoke(std::string_view member, pelta::CallKind kind,
                          std::span<pelta::Variant> args) override;
    std::string typeName() const override;

private:
    std::string progId_;
};

// The identifiers the stand-ins are registered under by registerFramework.
inline constexpr const char* kProgIdDmaDetails = "PeltaDma15.frmDmaDetails";
inline constexpr const char* kProgIdStoLedgerItem = "PeltaTrade15.cRepStoLedgerItem";

}  // namespace pelta::fw
