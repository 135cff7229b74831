#include "framework/siblings.h"

#include <mutex>

namespace pelta::fw {

namespace {

struct Journal {
    std::mutex mutex;
    std::vector<SiblingCall> calls;
};

Journal& journal() {
    static auto* j = new Journal();
    return *j;
}

void record(const std::string& progId, std::string_view member, std::vector<pelta::Variant> args) {
    auto& j = journal();
    std::lock_guard lock(j.mutex);
    j.calls.push_back(SiblingCall{progId, std::string(member), std::move(args)});
}

}  // namespace

std::vector<SiblingCall> siblingCalls() {
    auto& j = journal();
    std::lock_guard lock(j.mutex);
    return j.calls;
}

void clearSiblingCalls() {
    auto& j = journal();
    std::lock_guard lock(j.mutex);
    j.calls.clear();
}

pelta::Variant SiblingForm::invoke(std::string_view member, pelta::CallKind,
                                   std::span<pelta::Variant> args) {
    record(progId_, member, {args.begin(), args.end()});
    return pelta::Variant(true);
}

std::string SiblingForm::typeName() const {
    return progId_.substr(progId_.find('.') + 1);
}

bool SiblingReport::InitClientSite(PeltaNom15::IClientSite* Site) {
    record(progId_, "InitClientSite", {pelta::Variant(pelta::ObjectRef(Site))});
    return true;
}

bool SiblingReport::ShowReport(const pelta::Variant& Params) {
    record(progId_, "ShowReport", {Params});
    return true;
}

pelta::Variant SiblingReport::invoke(std::string_view member, pelta::CallKind,
                                     std::span<pelta::Variant> args) {
    record(progId_, member, {args.begin(), args.end()});
    return pelta::Variant(true);
}

std::string SiblingReport::typeName() const {
    return progId_.substr(progId_.find('.') + 1);
}

}  // namespace pelta::fw
