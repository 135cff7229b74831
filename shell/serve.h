// `pelta serve`: the library's screens in a web browser.
//
//   pelta serve [--db FILE] [--address A] [--port P] [--web DIR]
//               [--session-timeout SECONDS] [--library FILE]
//
// Opens the business-logic service over FILE, else over the demo database in
// the user's data folder, which is created and filled with the demo data when
// missing (a FILE that is missing is created with the schema only).
//
// Listens on 127.0.0.1:8080 unless told otherwise; every session then works
// as the user "admin". On any address but a loopback one every new session
// must log in: a user name of an active user of the service's users table and
// the password set in the environment variable PELTA_SHELL_PASSWORD (the
// users table keeps no passwords yet); without that variable the server
// refuses to start.
#pragma once

#include <optional>
#include <string>
#include <vector>

namespace pelta::shell {

struct ServeOptions {
    std::string database;  // empty: the demo database in the user's data folder
    std::string address = "127.0.0.1";
    int port = 8080;
    std::string webRoot;
    std::string library;
    int sessionTimeoutSeconds = 45;
    int heartbeatSeconds = 10;
};

// Parses the arguments after "serve"; nullopt and a message in `error` when
// they are wrong.
std::optional<ServeOptions> parseServeOptions(const std::vector<std::string>& args,
                                              std::string& error);

// True for 127.0.0.0/8, ::1 and "localhost".
bool isLoopback(const std::string& address);

// $XDG_DATA_HOME/pelta/demo.db, else ~/.local/share/pelta/demo.db.
std::string defaultDemoDatabase();

// Serves until SIGINT or SIGTERM; answers the exit code.
int serve(const ServeOptions& options);

inline constexpr const char* kServeUsage =
    "pelta serve [--db FILE] [--address A] [--port P] [--web DIR] [--library FILE]\n"
    "            [--session-timeout SECONDS]\n";

}  // namespace pelta::shell
