// The library as the shell loads it: registered through its in-process server
// entry points, its public list controls ("ctx...") offered as navigation, and
// one entry object per session. Lists are created by programmatic identifier
// and handed to the framework adapter that turns them into screens.
#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "platform/automation/object.h"
#include "shell/screen.h"

namespace pelta::shell {

// The framework's side of one session, made on the session's user-interface
// thread and released there: turns a created list control into a screen
// (gives it a client site over the session's business-logic connection, lets
// the framework fetch and fill it, and answers the shell's questions from its
// extenders).
class ListAdapter {
public:
    virtual ~ListAdapter() = default;
    virtual std::shared_ptr<Screen> openList(pelta::ObjectRef control) = 0;
};
using ListAdapterFactory = std::function<std::unique_ptr<ListAdapter>(ScreenHost& host)>;

class LibraryHost : public ScreenProvider {
public:
    // Registers the library file (DllRegisterServer) and reads its public
    // objects back from the registry. Raises pelta::Error when it cannot.
    // Lists whose class the library cannot create yet are offered disabled.
    explicit LibraryHost(std::string libraryFile, std::string libraryName = "PeltaNom15");

    // Without an adapter opening a list raises an error that says so.
    void setListAdapter(ListAdapterFactory factory) { factory_ = std::move(factory); }

    const std::string& libraryFile() const noexcept { return file_; }

    std::vector<NavigationEntry> navigation() override;
    std::unique_ptr<LibrarySession> startSession(ScreenHost& host) override;

private:
    std::string file_;
    std::string name_;
    std::vector<NavigationEntry> lists_;
    ListAdapterFactory factory_;
};

}  // namespace pelta::shell
