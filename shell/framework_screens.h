// The adapter from the framework's extenders to the shell's screens.
//
// Per browser session, on its user-interface thread: a business-logic
// connection for the person, the framework's user agent of that thread (the
// session's dialog broker), and the screens made from the library's list
// controls and from the detail forms they show. A list screen answers from
// its control's form extender (caption, menu) and grid extender (columns,
// rows paged and sorted on a clone of the grid's view); a detail screen from
// its form extender's declared controls and the grid extenders it owns.
#pragma once

#include <string>

#include "shell/library_host.h"

namespace pelta::shell {

struct FrameworkOptions {
    std::string database;  // the SQLite file of the business-logic service
    // The user of a session nobody logged into (a loopback address).
    std::string defaultUser = "admin";
};

// Registers the framework's classes in the process (once) and answers the
// factory of per-session adapters for LibraryHost::setListAdapter.
ListAdapterFactory frameworkListAdapter(FrameworkOptions options);

// The key of a grid row as the page sends it back: the row's bookmark.
std::string rowKey(const Variant& bookmark);
// The bookmark of a row key; Empty when the text is not one.
Variant rowBookmark(const std::string& key);

}  // namespace pelta::shell
