// The page's JSON interface, independent of the HTTP server that carries it.
//
//   GET    /api/info                           program, library and database
//   POST   /api/session        {user?, password?}  a new session (the page's own)
//   DELETE /api/session                        ends the session
//   POST   /api/session/close                  the same, for a closing tab's beacon
//   GET    /api/navigation                     the library's public lists
//   POST   /api/lists          {id}            opens a list; answers its screen
//   GET    /api/screens                        the open screens
//   GET    /api/screens/N                      caption, commands, controls, grids
//   GET    /api/screens/N/rows ?grid&offset&count&sort=Col:asc,Col:desc
//   POST   /api/screens/N/execute {command, grid?, current?, selected?}
//   POST   /api/screens/N/values  {control, value}
//   POST   /api/screens/N/save
//   POST   /api/screens/N/addrow {grid}           a new row in an editable grid
//   POST   /api/screens/N/cells  {grid, row, column, value}  a cell typed
//   POST   /api/screens/N/group  {grid, value}    the group a grouped grid shows
//   POST   /api/screens/N/attributes {grid?, field, value}  an attribute entered
//   POST   /api/screens/N/attributebutton {grid?, field}  a selector row's button
//   POST   /api/screens/N/attributeselect {grid?, field}  the chosen attribute row
//   POST   /api/screens/N/activate {tree?, key}   a tree node clicked
//   POST   /api/screens/N/current {grid, row}  the row the person stands on
//   DELETE /api/screens/N      ?force=1        closes the screen
//   POST   /api/dialog/N       {button, value?} answers a waiting dialog
//                              {button, current?, selected?} a selector's rows
//   GET    /api/downloads/T                    a file a screen wrote (once; see
//                                              the "download" event)
//
// The session travels in the X-Pelta-Session header, the "session" query
// parameter (event streams and beacons) or the pelta_session cookie. Errors
// answer {"error": {"status", "message", ...}} with a 4xx or 5xx status.
#pragma once

#include <functional>
#include <map>
#include <memory>
#include <string>

namespace pelta::shell {

class SessionManager;
class Session;

struct ApiRequest {
    std::string method;
    std::string path;
    std::map<std::string, std::string> query;
    std::string body;
    std::string sessionId;
};

struct ApiResponse {
    int status = 200;
    std::string body;
    std::string setCookie;  // a Set-Cookie value, when the session changes
    // A body that is not JSON (a download): its type and disposition.
    std::string contentType = {};
    std::string disposition = {};
};

struct ApiOptions {
    bool requireLogin = false;
    std::string password;  // required of new sessions when requireLogin
    // Whether a login name is a known, active user of the service; unset
    // accepts any name.
    std::function<bool(const std::string& user)> userExists;
    std::string version;
    std::string library;     // the library file in use
    std::string database;    // the database file in use
    int maxPageRows = 1000;  // the most rows one page request returns
};

class Api {
public:
    Api(SessionManager& sessions, ApiOptions options);

    // Never throws: every failure becomes an error response.
    ApiResponse handle(const ApiRequest& request);

    // The session a request names, or null.
    std::shared_ptr<Session> sessionOf(const std::string& sessionId);

    const ApiOptions& options() const noexcept { return options_; }

private:
    ApiResponse route(const ApiRequest& request);

    SessionManager& sessions_;
    ApiOptions options_;
};

// A JSON error body.
std::string errorBody(int status, const std::string& message);
// True for 32 lower-case hexadecimal digits.
bool wellFormedSessionId(const std::string& id);

}  // namespace pelta::shell
