// The library was written for one user-interface thread per process, and its
// own state (the loaded forms, the instance register) is not guarded. Each
// browser session has its own user-interface thread, so the sessions' threads
// take turns: a thread holds the apartment while it runs a task, and gives it
// up while it waits for a person to answer a dialog, as the original platform
// let other work run while a message box was up.
#pragma once

#include <mutex>

namespace pelta::shell {

// Held by a user-interface thread for the length of one task.
class ApartmentScope {
public:
    ApartmentScope();
    ~ApartmentScope();
    ApartmentScope(const ApartmentScope&) = delete;
    ApartmentScope& operator=(const ApartmentScope&) = delete;

private:
    std::unique_lock<std::mutex> lock_;
};

// Gives the apartment up for its lifetime when the calling thread holds it
// (a thread waiting for an answer), and takes it back afterwards.
class ApartmentRelease {
public:
    ApartmentRelease();
    ~ApartmentRelease();
    ApartmentRelease(const ApartmentRelease&) = delete;
    ApartmentRelease& operator=(const ApartmentRelease&) = delete;

private:
    std::unique_lock<std::mutex>* held_;
};

}  // namespace pelta::shell
