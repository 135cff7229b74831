#include "framework/services.h"

#include <algorithm>
#include <system_error>

#include "framework/attrib_grid.h"
#include "framework/extenders.h"
#include "framework/form_extender.h"
#include "framework/grid_extender.h"
#include "framework/record_deletion.h"
#include "library/contracts/Public.h"
#include "platform/automation/ascii.h"
#include "platform/automation/error.h"
#include "platform/automation/registry.h"
#include "platform/data/propertybag.h"

namespace pelta::fw {

using namespace PeltaNom15;

namespace {}  // namespace

// ---- HostLogger ---------------------------------------------------------------------

bool HostLogger::Open(const std::string& FileName) {
    Close();
    out_.open(FileName, std::ios::out | std::ios::app | std::ios::binary);
    if (!out_) return false;
    fileName_ = FileName;
    return true;
}

void HostLogger::Print(const std::string& Line) {
    if (!out_.is_open()) return;
    out_ << Line << '\n';
    out_.flush();
}

int64_t HostLogger::Length() {
    if (!out_.is_open()) return 0;
    out_.flush();
    std::error_code ec;
    auto size = std::filesystem::file_size(fileName_, ec);
    return ec ? 0 : static_cast<int64_t>(size);
}

void HostLogger::Close() {
    if (out_.is_open()) out_.close();
    out_.clear();
    fileName_.clear();
}

// ---- DebugConsole -------------------------------------------------------------------

int32_t DebugConsole::NextInstanceID() {
    std::lock_guard lock(mutex_);
    return ++lastID_;
}

bool DebugConsole::AddInstance(const std::string& Key, const std::string& Description) {
    std::lock_guard lock(mutex_);
    return instances_.emplace(Key, Description).second;
}

bool DebugConsole::RemoveInstance(const std::string& Key) {
    std::lock_guard lock(mutex_);
    return instances_.erase(Key) > 0;
}

int32_t DebugConsole::InstanceCount() {
    std::lock_guard lock(mutex_);
    return static_cast<int32_t>(instances_.size());
}

void DebugConsole::RefreshConsole() {
    std::lock_guard lock(mutex_);
    ++refreshes_;
}

std::map<std::string, std::string> DebugConsole::instances() const {
    std::lock_guard lock(mutex_);
    return instances_;
}

int32_t DebugConsole::refreshCount() const {
    std::lock_guard lock(mutex_);
    return refreshes_;
}

// ---- HostApplication ----------------------------------------------------------------

HostApplication::HostApplication()
    : logger_(pelta::makeRef<HostLogger>()), console_(pelta::makeRef<fw::DebugConsole>()) {}

std::string HostApplication::LogName() {
    std::lock_guard lock(mutex_);
    return logName_;
}

int32_t HostApplication::ErrorHook(int32_t Number, const std::string& Source,
                                   const std::string& Description, const std::string& Location) {
    std::lock_guard lock(mutex_);
    offered_.push_back(OfferedError{Number, Source, Description, Location});
    return errorAction_;
}

pelta::Ref<IHostLogger> HostApplication::Logger() {
    std::lock_guard lock(mutex_);
    return logger_;
}

pelta::Ref<IDebugConsole> HostApplication::DebugConsole() {
    std::lock_guard lock(mutex_);
    return console_;
}

pelta::ObjectRef HostApplication::CreateForm(const std::string& ProgID) {
    try {
        return pelta::createObject(ProgID);
    } catch (const pelta::Error&) {
        return nullptr;
    }
}

pelta::Variant HostApplication::Option(const std::string& Name) {
    std::lock_guard lock(mutex_);
    auto it = options_.find(lowerAscii(Name));
    return it == options_.end() ? pelta::Variant() : it->second;
}

void HostApplication::setLogName(std::string name) {
    std::lock_guard lock(mutex_);
    logName_ = std::move(name);
}

void HostApplication::setErrorAction(int32_t action) {
    std::lock_guard lock(mutex_);
    errorAction_ = action;
}

std::vector<OfferedError> HostApplication::offeredErrors() const {
    std::lock_guard lock(mutex_);
    return offered_;
}

void HostApplication::clearOfferedErrors() {
    std::lock_guard lock(mutex_);
    offered_.clear();
}

void HostApplication::setLogger(pelta::Ref<IHostLogger> logger) {
    std::lock_guard lock(mutex_);
    logger_ = std::move(logger);
}

void HostApplication::setDebugConsole(pelta::Ref<IDebugConsole> console) {
    std::lock_guard lock(mutex_);
    console_ = std::move(console);
}

void HostApplication::setOption(const std::string& name, pelta::Variant value) {
    std::lock_guard lock(mutex_);
    options_[lowerAscii(name)] = std::move(value);
}

// ---- ClientSite ---------------------------------------------------------------------

ClientSite::ClientSite(pelta::Ref<IBllConnection> connection, bool selector)
    : connection_(std::move(connection)), selector_(selector) {}

pelta::Ref<IBllConnection> ClientSite::Connection() {
    return connection_;
}

pelta::Variant ClientSite::Parameter(const std::string& Name) {
    auto it = parameters_.find(lowerAscii(Name));
    return it == parameters_.end() ? pelta::Variant() : it->second;
}

bool ClientSite::IsSelector() {
    return selector_;
}

ClientSite& ClientSite::setParameter(const std::string& name, pelta::Variant value) {
    parameters_[lowerAscii(name)] = std::move(value);
    return *this;
}

// ---- SettingsStore ------------------------------------------------------------------
//
// The file holds one property bag: a property per layout key, each a bag of
// the settings kept under that key.

pelta::Variant SettingsStore::get(const std::string& layoutKey, const std::string& name,
                                  const pelta::Variant& defaultValue) const {
    std::lock_guard lock(mutex_);
    auto screen = values_.find(lowerAscii(layoutKey));
    if (screen == values_.end()) return defaultValue;
    auto it = screen->second.find(lowerAscii(name));
    return it == screen->second.end() ? defaultValue : it->second;
}

void SettingsStore::put(const std::string& layoutKey, const std::string& name,
                        pelta::Variant value) {
    std::lock_guard lock(mutex_);
    values_[lowerAscii(layoutKey)][lowerAscii(name)] = std::move(value);
    writeFile();
}

void SettingsStore::setFile(std::filesystem::path file) {
    std::lock_guard lock(mutex_);
    file_ = std::move(file);
    if (file_.empty()) return;
    std::ifstream in(file_, std::ios::binary);
    if (!in) return;
    pelta::Bytes bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    try {
        auto all = pelta::PropertyBag::fromContents(bytes);
        decltype(values_) loaded;
        for (const auto& key : all->names()) {
            auto* screen = pelta::query<pelta::PropertyBag>(all->readProperty(key).object());
            if (!screen) continue;
            auto& into = loaded[lowerAscii(key)];
            for (const auto& name : screen->names())
                into[lowerAscii(name)] = screen->readProperty(name);
        }
        values_ = std::move(loaded);
    } catch (const pelta::Error&) {
        // A damaged settings file costs the layouts, not the session: start
        // from the defaults and overwrite it on the next change.
    }
}

void SettingsStore::clear() {
    std::lock_guard lock(mutex_);
    values_.clear();
}

void SettingsStore::writeFile() const {
    if (file_.empty()) return;
    auto all = pelta::makeRef<pelta::PropertyBag>();
    for (const auto& [key, settings] : values_) {
        auto screen = pelta::makeRef<pelta::PropertyBag>();
        for (const auto& [name, value] : settings)
            screen->writeProperty(name, value);
        all->writeProperty(key, pelta::Variant(pelta::ObjectRef(screen)));
    }
    auto bytes = all->contents();
    auto temp = file_;
    temp += ".tmp";
    {
        std::ofstream out(temp, std::ios::binary | std::ios::trunc);
        if (!out)
            pelta::raise(pelta::errc::PathNotFound,
                         "Cannot write the settings file " + file_.string());
        out.write(reinterpret_cast<const char*>(bytes.data()),
                  static_cast<std::streamsize>(bytes.size()));
        if (!out)
            pelta::raise(pelta::errc::Fail, "Cannot write the settings file " + file_.string());
    }
    std::filesystem::rename(temp, file_);
}

// ---- FrameworkServices --------------------------------------------------------------

FrameworkServices::FrameworkServices()
    : host_(pelta::makeRef<fw::HostApplication>()),
      deletion_(pelta::makeRef<fw::RecordDeletion>()) {}

pelta::Ref<FrameworkServices> FrameworkServices::instance() {
    // Never destroyed: screens may still release their objects while the
    // process ends.
    static FrameworkServices* shared = [] {
        auto* s = new FrameworkServices;
        s->addRef();
        return s;
    }();
    return pelta::Ref<FrameworkServices>(shared);
}

pelta::Ref<FrameworkServices> services() {
    return FrameworkServices::instance();
}

pelta::Ref<IHostApplication> FrameworkServices::HostApplication() {
    return host();
}

int32_t FrameworkServices::MsgBox(const std::string& Text, int32_t Style,
                                  const std::string& Caption, const std::string& Details) {
    auto agent = currentUserAgent();
    if (!agent)
        pelta::raise(pelta::errc::Fail, "No user agent answers the message \"" + Text + "\"",
                     "FrameworkServices.MsgBox");
    Prompt p;
    p.kind = PromptKind::MessageBox;
    p.text = Text;
    p.style = Style;
    p.caption = Caption;
    p.details = Details;
    return agent->messageBox(p);
}

bool FrameworkServices::ShowSelector(pelta::Object* Selector, const std::string& Caption,
                                     pelta::Variant& Result) {
    static constexpr const char* kSource = "FrameworkServices.ShowSelector";
    Result = pelta::Variant();
    auto* selector = pelta::query<IZonSelector>(Selector);
    if (!selector)
        pelta::raise(pelta::errc::InvalidProcedureCall, "The object shown is not a selector",
                     kSource);
    pelta::Ref<FormExtender> form(formOfOwner(Selector));
    // The list's own grid: "geCtl" when it has one, else the first it made.
    pelta::Ref<GridExtender> grid;
    for (GridExtender* g : gridsOfOwner(Selector))
        if (!grid || equalsNoCaseAscii(g->GridName(), "geCtl")) grid = g;
    if (!form || !grid)
        pelta::raise(pelta::errc::ObjectRequired,
                     "The selector has no list to show: it is shown after its InitClientSite",
                     kSource);
    auto agent = currentUserAgent();
    if (!agent)
        pelta::raise(pelta::errc::Fail,
                     "No user agent shows the selector \"" + form->Caption() + "\"", kSource);
    // Read when first shown; later shown as it stands, with the person's filter.
    if (!grid->Rows() && (!form->Refresh() || !grid->Rows())) return false;
    ListPick pick;
    pick.caption = Caption.empty() ? form->Caption() : Caption;
    pick.selector = Selector;
    pick.form = form.get();
    pick.grid = grid.get();
    if (!agent->chooseFromList(pick)) return false;
    // What the person left in the grid is the choice; the selector answers it.
    pelta::Variant current, search;
    return selector->ShowSelect(current, search, Result);
}

pelta::ObjectRef FrameworkServices::CreateObject(const std::string& ProgID) {
    {
        std::lock_guard lock(mutex_);
        if (refused_.count(lowerAscii(ProgID))) return nullptr;
    }
    try {
        return pelta::createObject(ProgID);
    } catch (const pelta::Error&) {
        return nullptr;
    }
}

pelta::Ref<IRecordDeletion> FrameworkServices::RecordDeletion() {
    return recordDeletion();
}

int32_t FrameworkServices::MousePointer() {
    std::lock_guard lock(mutex_);
    return mousePointer_;
}

void FrameworkServices::SetMousePointer(int32_t Pointer) {
    std::lock_guard lock(mutex_);
    mousePointer_ = Pointer;
}

pelta::Ref<fw::HostApplication> FrameworkServices::host() {
    std::lock_guard lock(mutex_);
    return host_;
}

void FrameworkServices::setHostApplication(pelta::Ref<fw::HostApplication> host) {
    std::lock_guard lock(mutex_);
    host_ = host ? std::move(host) : pelta::makeRef<fw::HostApplication>();
}

void FrameworkServices::setUserAgent(pelta::Ref<UserAgent> agent) {
    std::lock_guard lock(mutex_);
    agent_ = std::move(agent);
}

pelta::Ref<UserAgent> FrameworkServices::userAgent() {
    std::lock_guard lock(mutex_);
    return agent_;
}

pelta::Ref<fw::RecordDeletion> FrameworkServices::recordDeletion() {
    std::lock_guard lock(mutex_);
    return deletion_;
}

void FrameworkServices::refuseObject(const std::string& progId) {
    std::lock_guard lock(mutex_);
    refused_.insert(lowerAscii(progId));
}

void FrameworkServices::allowObject(const std::string& progId) {
    std::lock_guard lock(mutex_);
    refused_.erase(lowerAscii(progId));
}

void FrameworkServices::addForm(FormExtender* form) {
    std::lock_guard lock(mutex_);
    forms_.emplace_back(form, std::this_thread::get_id());
}

void FrameworkServices::removeForm(FormExtender* form) {
    std::lock_guard lock(mutex_);
    forms_.erase(std::remove_if(forms_.begin(), forms_.end(),
                                [&](const auto& f) { return f.first == form; }),
                 forms_.end());
}

std::vector<FormExtender*> FrameworkServices::forms() const {
    std::lock_guard lock(mutex_);
    std::vector<FormExtender*> out;
    for (const auto& f : forms_)
        out.push_back(f.first);
    return out;
}

std::vector<FormExtender*> FrameworkServices::threadForms() const {
    const auto self = std::this_thread::get_id();
    std::lock_guard lock(mutex_);
    std::vector<FormExtender*> out;
    for (const auto& f : forms_)
        if (f.second == self) out.push_back(f.first);
    return out;
}

FormExtender* FrameworkServices::formOfOwner(const pelta::Object* owner) const {
    if (!owner) return nullptr;
    std::lock_guard lock(mutex_);
    for (const auto& f : forms_)
        if (f.first->owner() == owner) return f.first;
    return nullptr;
}

void FrameworkServices::addGrid(GridExtender* grid) {
    std::lock_guard lock(mutex_);
    grids_.emplace_back(grid, std::this_thread::get_id());
}

void FrameworkServices::removeGrid(GridExtender* grid) {
    std::lock_guard lock(mutex_);
    grids_.erase(std::remove_if(grids_.begin(), grids_.end(),
                                [&](const auto& g) { return g.first == grid; }),
                 grids_.end());
}

std::vector<GridExtender*> FrameworkServices::gridsOfOwner(const pelta::Object* owner) const {
    std::vector<GridExtender*> out;
    if (!owner) return out;
    const auto self = std::this_thread::get_id();
    std::lock_guard lock(mutex_);
    for (const auto& g : grids_)
        if (g.second == self && g.first->owner() == owner) out.push_back(g.first);
    return out;
}

void FrameworkServices::addQuickFilter(QuickFilterExtender* filter) {
    std::lock_guard lock(mutex_);
    quickFilters_.emplace_back(filter, std::this_thread::get_id());
}

void FrameworkServices::removeQuickFilter(QuickFilterExtender* filter) {
    std::lock_guard lock(mutex_);
    quickFilters_.erase(std::remove_if(quickFilters_.begin(), quickFilters_.end(),
                                       [&](const auto& f) { return f.first == filter; }),
                        quickFilters_.end());
}

std::vector<QuickFilterExtender*> FrameworkServices::quickFiltersOfOwner(
    const pelta::Object* owner) const {
    std::vector<QuickFilterExtender*> out;
    if (!owner) return out;
    const auto self = std::this_thread::get_id();
    std::lock_guard lock(mutex_);
    for (const auto& f : quickFilters_)
        if (f.second == self && f.first->owner() == owner) out.push_back(f.first);
    return out;
}

namespace {

// The extenders of a register made on the calling thread for `owner`.
template <class T>
std::vector<T*> ofOwner(const std::vector<std::pair<T*, std::thread::id>>& all,
                        const pelta::Object* owner) {
    std::vector<T*> out;
    if (!owner) return out;
    const auto self = std::this_thread::get_id();
    for (const auto& e : all)
        if (e.second == self && e.first->owner() == owner) out.push_back(e.first);
    return out;
}

template <class T>
void unregister(std::vector<std::pair<T*, std::thread::id>>& all, T* extender) {
    all.erase(
        std::remove_if(all.begin(), all.end(), [&](const auto& e) { return e.first == extender; }),
        all.end());
}

}  // namespace

void FrameworkServices::addAttribGrid(AttribGridExtender* grid) {
    std::lock_guard lock(mutex_);
    attribGrids_.emplace_back(grid, std::this_thread::get_id());
}

void FrameworkServices::removeAttribGrid(AttribGridExtender* grid) {
    std::lock_guard lock(mutex_);
    unregister(attribGrids_, grid);
}

std::vector<AttribGridExtender*> FrameworkServices::attribGridsOfOwner(
    const pelta::Object* owner) const {
    std::lock_guard lock(mutex_);
    return ofOwner(attribGrids_, owner);
}

void FrameworkServices::addTree(TreeExtender* tree) {
    std::lock_guard lock(mutex_);
    trees_.emplace_back(tree, std::this_thread::get_id());
}

void FrameworkServices::removeTree(TreeExtender* tree) {
    std::lock_guard lock(mutex_);
    unregister(trees_, tree);
}

std::vector<TreeExtender*> FrameworkServices::treesOfOwner(const pelta::Object* owner) const {
    std::lock_guard lock(mutex_);
    return ofOwner(trees_, owner);
}

void FrameworkServices::reset() {
    {
        std::lock_guard lock(mutex_);
        host_ = pelta::makeRef<fw::HostApplication>();
        agent_.reset();
        deletion_ = pelta::makeRef<fw::RecordDeletion>();
        refused_.clear();
        mousePointer_ = 0;
    }
    settings_.setFile({});
    settings_.clear();
}

}  // namespace pelta::fw
