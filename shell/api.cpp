#include "shell/api.h"

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <nlohmann/json.hpp>
#include <stdexcept>
#include <thread>
#include <vector>

#include "library/contracts/Constants.h"
#include "platform/automation/error.h"
#include "shell/downloads.h"
#include "shell/log.h"
#include "shell/session.h"
#include "shell/variant_json.h"

namespace pelta::shell {

using json = nlohmann::json;

namespace {

// A refusal of a request, turned into its error response.
struct ApiError : std::runtime_error {
    ApiError(int status, const std::string& message)
        : std::runtime_error(message), status(status) {}
    int status;
};

std::string dump(const json& j) {
    // Texts come from screens and the database: invalid UTF-8 is replaced, never thrown.
    return j.dump(-1, ' ', false, json::error_handler_t::replace);
}

ApiResponse ok(const json& body, int status = 200) {
    return ApiResponse{status, dump(body), {}};
}

std::vector<std::string> splitPath(const std::string& path) {
    std::vector<std::string> parts;
    size_t start = 0;
    while (start <= path.size()) {
        size_t end = path.find('/', start);
        if (end == std::string::npos) end = path.size();
        if (end > start) parts.push_back(path.substr(start, end - start));
        start = end + 1;
    }
    return parts;
}

// A whole decimal number within [lo, hi], or an ApiError naming `what`.
int64_t parseInteger(const std::string& text, int64_t lo, int64_t hi, const char* what) {
    if (text.empty() || text.size() > 18) throw ApiError(400, std::string("Bad ") + what);
    int64_t v = 0;
    for (char c : text) {
        if (c < '0' || c > '9') throw ApiError(400, std::string("Bad ") + what);
        v = v * 10 + (c - '0');
    }
    if (v < lo || v > hi) throw ApiError(400, std::string(what) + " out of range");
    return v;
}

json parseBody(const ApiRequest& r) {
    if (r.body.empty()) return json::object();
    json j = json::parse(r.body, nullptr, false);
    if (j.is_discarded()) throw ApiError(400, "The body is not valid JSON");
    if (!j.is_object()) throw ApiError(400, "The body must be a JSON object");
    return j;
}

std::string stringField(const json& body, const char* name, bool required) {
    auto it = body.find(name);
    if (it == body.end() || it->is_null()) {
        if (required) throw ApiError(400, std::string("Missing field \"") + name + "\"");
        return {};
    }
    if (!it->is_string()) throw ApiError(400, std::string("Field \"") + name + "\" must be text");
    return it->get<std::string>();
}

int64_t integerField(const json& body, const char* name, int64_t lo, int64_t hi) {
    auto it = body.find(name);
    if (it == body.end()) throw ApiError(400, std::string("Missing field \"") + name + "\"");
    if (!it->is_number_integer())
        throw ApiError(400, std::string("Field \"") + name + "\" must be a whole number");
    // Unsigned values beyond int64 would wrap: check through the unsigned view first.
    if (it->is_number_unsigned() && it->get<uint64_t>() > static_cast<uint64_t>(hi))
        throw ApiError(400, std::string("Field \"") + name + "\" out of range");
    int64_t v = it->get<int64_t>();
    if (v < lo || v > hi) throw ApiError(400, std::string("Field \"") + name + "\" out of range");
    return v;
}

std::string shortcutOf(const CommandInfo& c) {
    if (!c.shortcut.empty()) return c.shortcut;
    if (auto tab = c.caption.find('\t'); tab != std::string::npos) return c.caption.substr(tab + 1);
    switch (c.id) {
        case PeltaNom15::kCmdNew:
            return "Ctrl+N";
        case PeltaNom15::kCmdOpen:
            return "Ctrl+O";
        case PeltaNom15::kCmdDeleteInactive:
            return "Del";
        case PeltaNom15::kCmdRefresh:
            return "F5";
        case PeltaNom15::kCmdSave:
            return "Ctrl+S";
    }
    return {};
}

json describeOptions(const std::vector<std::pair<std::string, std::string>>& options) {
    json out = json::array();
    for (const auto& [key, text] : options)
        out.push_back({{"key", key}, {"text", text}});
    return out;
}

json describeColumns(const std::vector<ColumnInfo>& columns) {
    json out = json::array();
    for (const ColumnInfo& c : columns)
        out.push_back({{"key", c.key},
                       {"caption", c.caption},
                       {"field", c.field},
                       {"visible", c.visible},
                       {"format", c.format},
                       {"editor", c.editor},
                       {"width", c.width},
                       {"options", describeOptions(c.options)}});
    return out;
}

json describeAttributeGrids(const std::vector<AttribGridInfo>& attributeGrids) {
    json out = json::array();
    for (const AttribGridInfo& g : attributeGrids) {
        json groups = json::array();
        for (const AttribGroupInfo& grp : g.groups)
            groups.push_back({{"number", grp.number}, {"caption", grp.caption}});
        json rows = json::array();
        for (const AttribRowInfo& r : g.rows) {
            json options = json::array();
            for (const AttribOption& o : r.options)
                options.push_back({{"key", o.key}, {"text", o.text}, {"parent", o.parentKey}});
            rows.push_back({{"group", r.group},
                            {"field", r.field},
                            {"caption", r.caption},
                            {"editor", r.editor},
                            {"value", toJson(r.value)},
                            {"text", r.text},
                            {"style", r.style},
                            {"options", options},
                            {"help", r.help}});
        }
        out.push_back({{"name", g.name},
                       {"groups", groups},
                       {"rows", rows},
                       {"selected", g.selected},
                       {"help", g.help}});
    }
    return out;
}

json describeTrees(const std::vector<TreeInfo>& trees) {
    json out = json::array();
    for (const TreeInfo& t : trees) {
        json nodes = json::array();
        for (const TreeNodeInfo& n : t.nodes)
            nodes.push_back({{"parent", n.parentKey}, {"key", n.key}, {"text", n.text}});
        out.push_back({{"name", t.name}, {"nodes", nodes}, {"selected", t.selected}});
    }
    return out;
}

json describeScreen(int64_t id, Screen& s) {
    json commands = json::array();
    for (const CommandInfo& c : s.commands()) {
        std::string caption = c.caption.substr(0, c.caption.find('\t'));
        commands.push_back({{"id", c.id},
                            {"caption", caption},
                            {"tooltip", c.tooltip},
                            {"shortcut", shortcutOf(c)},
                            {"enabled", c.enabled}});
    }
    json controls = json::array();
    for (const ControlInfo& c : s.controls()) {
        controls.push_back({{"name", c.name},
                            {"kind", c.kind},
                            {"caption", c.caption},
                            {"field", c.field},
                            {"group", c.group},
                            {"format", c.format},
                            {"hint", c.hint},
                            {"prompt", c.prompt},
                            {"readOnly", c.readOnly},
                            {"value", toJson(c.value)},
                            {"options", describeOptions(c.options)}});
    }
    json grids = json::array();
    for (const GridInfo& g : s.grids()) {
        json filters = json::array();
        for (const FilterFieldInfo& f : g.filters)
            filters.push_back({{"id", f.id}, {"caption", f.caption}, {"text", f.text}});
        grids.push_back({{"name", g.name},
                         {"columns", describeColumns(g.columns)},
                         {"rowCount", g.rowCount},
                         {"editable", g.editable},
                         {"groupColumn", g.groupColumn},
                         {"groups", g.groups},
                         {"group", g.group},
                         {"filters", filters},
                         {"filterHint", g.filterHint}});
    }
    return {{"id", id},
            {"kind", s.kind()},
            {"caption", s.caption()},
            {"commands", commands},
            {"controls", controls},
            {"grids", grids},
            {"attributeGrids", describeAttributeGrids(s.attributeGrids())},
            {"trees", describeTrees(s.trees())}};
}

// "Code:asc,Name:desc" against the grid's columns.
std::vector<SortKey> parseSort(const std::string& text, const GridInfo& grid) {
    std::vector<SortKey> keys;
    if (text.empty()) return keys;
    size_t start = 0;
    while (start <= text.size()) {
        size_t end = text.find(',', start);
        if (end == std::string::npos) end = text.size();
        std::string part = text.substr(start, end - start);
        SortKey key;
        if (auto colon = part.find(':'); colon != std::string::npos) {
            std::string dir = part.substr(colon + 1);
            if (dir == "desc")
                key.descending = true;
            else if (dir != "asc")
                throw ApiError(400, "Bad sort direction");
            part.resize(colon);
        }
        bool known = std::any_of(grid.columns.begin(), grid.columns.end(),
                                 [&](const ColumnInfo& c) { return c.key == part; });
        if (!known) throw ApiError(400, "Unknown sort column");
        key.column = part;
        keys.push_back(key);
        if (keys.size() > 8) throw ApiError(400, "Too many sort columns");
        start = end + 1;
    }
    return keys;
}

std::string queryValue(const ApiRequest& r, const char* name) {
    auto it = r.query.find(name);
    return it == r.query.end() ? std::string() : it->second;
}

bool constantTimeEquals(const std::string& a, const std::string& b) {
    unsigned char diff = a.size() == b.size() ? 0 : 1;
    for (size_t i = 0; i < a.size(); ++i)
        diff |= static_cast<unsigned char>(a[i] ^ (i < b.size() ? b[i] : 0));
    return diff == 0;
}

}  // namespace

std::string errorBody(int status, const std::string& message) {
    return dump(json{{"error", {{"status", status}, {"message", message}}}});
}

bool wellFormedSessionId(const std::string& id) {
    return id.size() == 32 && std::all_of(id.begin(), id.end(), [](char c) {
               return (c >= '0' && c <= '9') || (c >= 'a' && c <= 'f');
           });
}

Api::Api(SessionManager& sessions, ApiOptions options)
    : sessions_(sessions), options_(std::move(options)) {}

std::shared_ptr<Session> Api::sessionOf(const std::string& sessionId) {
    if (!wellFormedSessionId(sessionId)) return nullptr;
    return sessions_.find(sessionId);
}

ApiResponse Api::handle(const ApiRequest& request) {
    try {
        return route(request);
    } catch (const ApiError& e) {
        return ApiResponse{e.status, errorBody(e.status, e.what()), {}};
    } catch (const ThreadStopped&) {
        return ApiResponse{410, errorBody(410, "The session has ended"), {}};
    } catch (const pelta::Error& e) {
        // A screen's own failure: the page shows it; the session goes on.
        json body = {{"error",
                      {{"status", 422},
                       {"message", e.description()},
                       {"number", e.number()},
                       {"source", e.source()}}}};
        return ApiResponse{422, dump(body), {}};
    } catch (const std::exception& e) {
        logLine(std::string("request ") + request.method + " " + request.path +
                " failed: " + e.what());
        return ApiResponse{500, errorBody(500, "Internal error"), {}};
    } catch (...) {
        logLine(std::string("request ") + request.method + " " + request.path + " failed");
        return ApiResponse{500, errorBody(500, "Internal error"), {}};
    }
}

ApiResponse Api::route(const ApiRequest& r) {
    std::vector<std::string> p = splitPath(r.path);
    if (p.size() < 2 || p[0] != "api") throw ApiError(404, "No such resource");
    const std::string& m = r.method;
    const std::string& what = p[1];

    // ---- without a session ----------------------------------------------------
    if (what == "info" && p.size() == 2) {
        if (m != "GET") throw ApiError(405, "Method not allowed");
        return ok({{"program", "pelta"},
                   {"version", options_.version},
                   {"library", options_.library},
                   {"database", options_.database},
                   {"login", options_.requireLogin}});
    }
    if (what == "session" && p.size() == 2 && m == "POST") {
        json body = parseBody(r);
        std::string user;
        if (options_.requireLogin) {
            user = stringField(body, "user", false);
            std::string password = stringField(body, "password", false);
            bool known = !user.empty() && user.size() <= 100 &&
                         (!options_.userExists || options_.userExists(user));
            // Both checks run, so that a wrong user and a wrong password take as long.
            bool right = constantTimeEquals(password, options_.password);
            if (!known || !right) {
                std::this_thread::sleep_for(std::chrono::milliseconds(300));  // slows guessing
                throw ApiError(401, "Wrong user name or password");
            }
        }
        auto session = sessions_.create(user);
        if (!session) throw ApiError(503, "Too many sessions");
        ApiResponse resp = ok({{"session", session->id()}}, 201);
        resp.setCookie = "pelta_session=" + session->id() + "; Path=/; HttpOnly; SameSite=Strict";
        return resp;
    }

    // ---- within a session -----------------------------------------------------
    auto session = sessionOf(r.sessionId);
    if (!session) {
        throw ApiError(401, options_.requireLogin ? "Log in first" : "No session; start one first");
    }
    Session& s = *session;

    if (what == "session") {
        if ((p.size() == 2 && m == "DELETE") || (p.size() == 3 && p[2] == "close" && m == "POST")) {
            sessions_.release(s.id());
            ApiResponse resp = ok({{"closed", true}});
            resp.setCookie = "pelta_session=; Path=/; Max-Age=0; HttpOnly; SameSite=Strict";
            return resp;
        }
        throw ApiError(405, "Method not allowed");
    }

    if (what == "dialog") {
        if (p.size() != 3) throw ApiError(404, "No such resource");
        if (m != "POST") throw ApiError(405, "Method not allowed");
        auto id = static_cast<uint64_t>(parseInteger(p[2], 1, INT64_MAX / 2, "dialog id"));
        json body = parseBody(r);
        DialogAnswer answer;
        answer.button = static_cast<int32_t>(integerField(body, "button", 1, 7));
        if (body.contains("value")) answer.value = stringField(body, "value", false);
        // A selector's answer: the rows chosen in its list.
        answer.rows.current = stringField(body, "current", false);
        if (auto sel = body.find("selected"); sel != body.end() && !sel->is_null()) {
            if (!sel->is_array()) throw ApiError(400, "Field \"selected\" must be a list");
            if (sel->size() > 100000) throw ApiError(400, "Too many selected rows");
            for (const json& k : *sel) {
                if (!k.is_string()) throw ApiError(400, "Selected keys must be text");
                answer.rows.selected.push_back(k.get<std::string>());
            }
        }
        // Answered here, not on the session's thread: that thread is waiting for it.
        switch (s.dialogs().answer(id, answer)) {
            case DialogBroker::AnswerResult::Accepted:
                return ok({{"answered", true}});
            case DialogBroker::AnswerResult::UnknownDialog:
                throw ApiError(404, "No such dialog is waiting");
            case DialogBroker::AnswerResult::InvalidButton:
                throw ApiError(400, "The dialog has no such button");
        }
    }

    if (what == "downloads") {
        if (p.size() != 3) throw ApiError(404, "No such resource");
        if (m != "GET") throw ApiError(405, "Method not allowed");
        // Tokens are the shell's own 128 random bits; nothing else names a file.
        if (!wellFormedSessionId(p[2])) throw ApiError(404, "No such download");
        auto file = s.downloads()->take(p[2]);
        if (!file) throw ApiError(404, "No such download");
        ApiResponse resp{200, std::move(file->bytes), {}};
        resp.contentType = "application/octet-stream";
        resp.disposition = attachmentDisposition(file->name);
        return resp;
    }

    if (what == "navigation" && p.size() == 2) {
        if (m != "GET") throw ApiError(405, "Method not allowed");
        json lists = json::array();
        for (const NavigationEntry& e : sessions_.provider().navigation())
            lists.push_back({{"id", e.id}, {"caption", e.caption}, {"available", e.available}});
        return ok({{"lists", lists}});
    }

    if (what == "lists" && p.size() == 2) {
        if (m != "POST") throw ApiError(405, "Method not allowed");
        std::string id = stringField(parseBody(r), "id", true);
        if (id.empty() || id.size() > 200) throw ApiError(400, "Bad list id");
        return ok(s.ui().call([&] {
            int64_t screen = s.openList(id);
            return describeScreen(screen, *s.screen(screen));
        }));
    }

    if (what != "screens") throw ApiError(404, "No such resource");
    if (p.size() == 2) {
        if (m != "GET") throw ApiError(405, "Method not allowed");
        return ok(s.ui().call([&] {
            json list = json::array();
            for (auto& [id, screen] : s.screens())
                list.push_back(
                    {{"id", id}, {"kind", screen->kind()}, {"caption", screen->caption()}});
            return json{{"screens", list}};
        }));
    }
    int64_t id = parseInteger(p[2], 1, INT64_MAX / 2, "screen id");
    // What is asked of a screen also runs while that screen is shown in a
    // dialog its thread waits for.
    UiTaskTag tag(id);
    auto needScreen = [&]() -> std::shared_ptr<Screen> {
        auto screen = s.screen(id);
        if (!screen) throw ApiError(404, "No such screen");
        return screen;
    };

    if (p.size() == 3) {
        if (m == "GET") return ok(s.ui().call([&] { return describeScreen(id, *needScreen()); }));
        if (m == "DELETE") {
            bool force = queryValue(r, "force") == "1";
            return ok(s.ui().call([&] {
                needScreen();
                return json{{"closed", s.closeScreen(id, force)}};
            }));
        }
        throw ApiError(405, "Method not allowed");
    }
    if (p.size() != 4) throw ApiError(404, "No such resource");
    const std::string& action = p[3];

    if (action == "rows") {
        if (m != "GET") throw ApiError(405, "Method not allowed");
        int64_t offset =
            parseInteger(queryValue(r, "offset").empty() ? "0" : queryValue(r, "offset"), 0,
                         INT64_MAX / 2, "offset");
        int64_t count =
            parseInteger(queryValue(r, "count").empty() ? "100" : queryValue(r, "count"), 1,
                         options_.maxPageRows, "count");
        std::string gridName = queryValue(r, "grid");
        std::string sortText = queryValue(r, "sort");
        return ok(s.ui().call([&] {
            auto screen = needScreen();
            std::vector<GridInfo> grids = screen->grids();
            auto grid = std::find_if(grids.begin(), grids.end(), [&](const GridInfo& g) {
                return gridName.empty() || g.name == gridName;
            });
            if (grid == grids.end()) throw ApiError(400, "Unknown grid");
            RowsPage page = screen->rows(grid->name, offset, count, parseSort(sortText, *grid));
            json rows = json::array();
            for (const Row& row : page.rows) {
                json cells = json::array();
                for (const Variant& v : row.cells)
                    cells.push_back(toJson(v));
                rows.push_back({{"index", row.index}, {"key", row.key}, {"cells", cells}});
            }
            return json{{"grid", grid->name},
                        {"total", page.total},
                        {"offset", page.offset},
                        {"rows", rows}};
        }));
    }

    if (m != "POST") throw ApiError(405, "Method not allowed");
    json body = parseBody(r);
    auto findGrid = [&](Screen& screen, const std::string& name) {
        std::vector<GridInfo> grids = screen.grids();
        auto grid = std::find_if(grids.begin(), grids.end(),
                                 [&](const GridInfo& g) { return name.empty() || g.name == name; });
        if (grid == grids.end()) throw ApiError(400, "Unknown grid");
        return *grid;
    };
    if (action == "addrow") {
        std::string gridName = stringField(body, "grid", false);
        return ok(s.ui().call([&] {
            auto screen = needScreen();
            GridInfo grid = findGrid(*screen, gridName);
            if (!grid.editable) throw ApiError(400, "The grid cannot be edited");
            std::string key = screen->addRow(grid.name);
            return json{{"added", !key.empty()}, {"key", key}};
        }));
    }
    if (action == "cells") {
        std::string gridName = stringField(body, "grid", false);
        std::string row = stringField(body, "row", true);
        std::string column = stringField(body, "column", true);
        if (!body.contains("value")) throw ApiError(400, "Missing field \"value\"");
        const json& value = body["value"];
        if (!value.is_primitive()) throw ApiError(400, "Field \"value\" must be a plain value");
        return ok(s.ui().call([&] {
            auto screen = needScreen();
            GridInfo grid = findGrid(*screen, gridName);
            if (!grid.editable) throw ApiError(400, "The grid cannot be edited");
            auto c = std::find_if(grid.columns.begin(), grid.columns.end(),
                                  [&](const ColumnInfo& ci) { return ci.key == column; });
            if (c == grid.columns.end()) throw ApiError(400, "Unknown column");
            if (c->editor.empty()) throw ApiError(400, "The column is read-only");
            Variant typed;
            try {
                typed = fromJson(value, c->editor);
            } catch (const pelta::Error& e) {
                throw ApiError(400, e.description());
            }
            return json{{"ok", screen->editCell(grid.name, row, column, typed)}};
        }));
    }
    if (action == "group") {
        std::string gridName = stringField(body, "grid", false);
        std::string value = stringField(body, "value", true);
        return ok(s.ui().call([&] {
            auto screen = needScreen();
            GridInfo grid = findGrid(*screen, gridName);
            if (std::find(grid.groups.begin(), grid.groups.end(), value) == grid.groups.end())
                throw ApiError(400, "Unknown group");
            screen->setGroup(grid.name, value);
            return json{{"ok", true}};
        }));
    }
    if (action == "filter") {
        std::string gridName = stringField(body, "grid", false);
        auto field = static_cast<int32_t>(integerField(body, "field", INT32_MIN, INT32_MAX));
        std::string text = stringField(body, "text", false);
        if (text.size() > 1000) throw ApiError(400, "The filter text is too long");
        return ok(s.ui().call([&] {
            auto screen = needScreen();
            GridInfo grid = findGrid(*screen, gridName);
            if (std::none_of(grid.filters.begin(), grid.filters.end(),
                             [&](const FilterFieldInfo& f) { return f.id == field; }))
                throw ApiError(400, "Unknown filter field");
            screen->setFilter(grid.name, field, text);
            return json{{"ok", true}, {"total", screen->rows(grid.name, 0, 1, {}).total}};
        }));
    }
    // The attribute grid named in the body (the first when none is named)
    // and its row `field`.
    auto findAttribute = [&](Screen& screen, const std::string& gridName,
                             const std::string& field) {
        std::vector<AttribGridInfo> grids = screen.attributeGrids();
        auto grid = std::find_if(grids.begin(), grids.end(), [&](const AttribGridInfo& g) {
            return gridName.empty() || g.name == gridName;
        });
        if (grid == grids.end()) throw ApiError(400, "Unknown attribute grid");
        auto row = std::find_if(grid->rows.begin(), grid->rows.end(),
                                [&](const AttribRowInfo& r) { return r.field == field; });
        if (row == grid->rows.end()) throw ApiError(400, "Unknown attribute");
        return std::pair<std::string, AttribRowInfo>(grid->name, *row);
    };
    if (action == "attributes") {
        std::string gridName = stringField(body, "grid", false);
        std::string field = stringField(body, "field", true);
        if (!body.contains("value")) throw ApiError(400, "Missing field \"value\"");
        const json& value = body["value"];
        if (!value.is_primitive()) throw ApiError(400, "Field \"value\" must be a plain value");
        if (value.is_string() && value.get_ref<const std::string&>().size() > 100000)
            throw ApiError(400, "The value is too long");
        return ok(s.ui().call([&] {
            auto screen = needScreen();
            auto [grid, row] = findAttribute(*screen, gridName, field);
            if (row.editor == "selector")
                throw ApiError(400, "The attribute is chosen through its button");
            Variant typed;
            if (row.editor == "check") {
                try {
                    typed = fromJson(value, "check");
                } catch (const pelta::Error& e) {
                    throw ApiError(400, e.description());
                }
            } else {
                // Numbers stay as typed ("1,5"): the grid reads them.
                if (value.is_boolean()) throw ApiError(400, "Field \"value\" must be text");
                typed = fromJson(value, "text");
            }
            return json{{"ok", screen->setAttribute(grid, field, typed)}};
        }));
    }
    if (action == "attributebutton" || action == "attributeselect") {
        std::string gridName = stringField(body, "grid", false);
        std::string field = stringField(body, "field", true);
        return ok(s.ui().call([&] {
            auto screen = needScreen();
            auto [grid, row] = findAttribute(*screen, gridName, field);
            if (action == "attributeselect") {
                screen->selectAttribute(grid, field);
                return json{{"ok", true}};
            }
            if (row.editor != "selector") throw ApiError(400, "The attribute has no button");
            screen->attributeButton(grid, field);
            return json{{"ok", true}};
        }));
    }
    if (action == "activate") {
        std::string treeName = stringField(body, "tree", false);
        std::string key = stringField(body, "key", true);
        return ok(s.ui().call([&] {
            auto screen = needScreen();
            std::vector<TreeInfo> trees = screen->trees();
            auto tree = std::find_if(trees.begin(), trees.end(), [&](const TreeInfo& t) {
                return treeName.empty() || t.name == treeName;
            });
            if (tree == trees.end()) throw ApiError(400, "Unknown tree");
            if (std::none_of(tree->nodes.begin(), tree->nodes.end(),
                             [&](const TreeNodeInfo& n) { return n.key == key; }))
                throw ApiError(400, "Unknown node");
            return json{{"ok", screen->activateNode(tree->name, key)}};
        }));
    }
    if (action == "current") {
        std::string gridName = stringField(body, "grid", true);
        std::string row = stringField(body, "row", true);
        return ok(s.ui().call([&] {
            auto screen = needScreen();
            GridInfo grid = findGrid(*screen, gridName);
            if (!grid.editable) throw ApiError(400, "The grid cannot be edited");
            return json{{"ok", screen->chooseRow(grid.name, row)}};
        }));
    }
    if (action == "execute") {
        auto command = static_cast<int32_t>(integerField(body, "command", 1, 65535));
        CommandTarget target;
        target.grid = stringField(body, "grid", false);
        target.currentKey = stringField(body, "current", false);
        if (auto sel = body.find("selected"); sel != body.end() && !sel->is_null()) {
            if (!sel->is_array()) throw ApiError(400, "Field \"selected\" must be a list");
            if (sel->size() > 100000) throw ApiError(400, "Too many selected rows");
            for (const json& k : *sel) {
                if (!k.is_string()) throw ApiError(400, "Selected keys must be text");
                target.selectedKeys.push_back(k.get<std::string>());
            }
        }
        return ok(s.ui().call([&] {
            auto screen = needScreen();
            return json{{"handled", screen->execute(command, target)}};
        }));
    }
    if (action == "values") {
        std::string control = stringField(body, "control", true);
        if (!body.contains("value")) throw ApiError(400, "Missing field \"value\"");
        const json& value = body["value"];
        if (!value.is_primitive()) throw ApiError(400, "Field \"value\" must be a plain value");
        return ok(s.ui().call([&] {
            auto screen = needScreen();
            std::vector<ControlInfo> controls = screen->controls();
            auto c = std::find_if(controls.begin(), controls.end(),
                                  [&](const ControlInfo& ci) { return ci.name == control; });
            if (c == controls.end()) throw ApiError(400, "Unknown control");
            if (c->readOnly) throw ApiError(400, "The control is read-only");
            Variant typed;
            try {
                typed = fromJson(value, c->kind);
            } catch (const pelta::Error& e) {
                throw ApiError(400, e.description());
            }
            screen->setValue(control, typed);
            return json{{"ok", true}};
        }));
    }
    if (action == "save") {
        return ok(s.ui().call([&] {
            auto screen = needScreen();
            bool saved = screen->save();
            return json{{"saved", saved}, {"unchanged", screen->savedNothing()}};
        }));
    }
    throw ApiError(404, "No such resource");
}

}  // namespace pelta::shell
