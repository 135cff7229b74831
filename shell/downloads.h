// Files a screen writes for the person in front of it (a barcode saved as a
// metafile), offered to the page as downloads. The screen asks where to
// write through its user agent; the web agent answers a path of the shell's
// own choosing in a private folder (never one a request names). When the
// screen's action has ended, each file written is announced to the page as a
// "download" event and served once, by its random token, to that session.
#pragma once

#include <cstdint>
#include <filesystem>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

namespace pelta::shell {

class EventChannel;

class Downloads {
public:
    explicit Downloads(EventChannel& events);
    ~Downloads();  // removes every file not fetched, and the folder
    Downloads(const Downloads&) = delete;
    Downloads& operator=(const Downloads&) = delete;

    // A fresh path for a file the page will receive as `fileName` (its last
    // component, made safe); nullopt when no private folder can be made.
    std::optional<std::filesystem::path> reserve(const std::string& fileName);

    // Announces the reserved files that were written ("download": token,
    // name, size) and forgets the others.
    void offer();

    struct File {
        std::string name;
        std::string bytes;
    };
    // The file of `token`, once; nullopt for an unknown or fetched token.
    std::optional<File> take(const std::string& token);

    // Files larger are not offered; at most so many wait to be fetched (the
    // oldest go first).
    static constexpr uintmax_t kMaxBytes = 16u << 20;
    static constexpr size_t kMaxWaiting = 16;

private:
    struct Entry {
        std::string token;
        std::string name;
        std::filesystem::path path;
    };
    void discard(const Entry& e);

    EventChannel& events_;
    std::mutex mutex_;
    std::filesystem::path root_;  // made on first use, mode 0700
    std::vector<Entry> reserved_;
    std::vector<Entry> waiting_;
};

// The name a file is offered under: its last path component, control
// characters and separators replaced, at most 120 bytes; "download" when
// nothing usable is left.
std::string safeDownloadName(const std::string& fileName);
// A Content-Disposition value for an attachment of that name.
std::string attachmentDisposition(const std::string& name);

}  // namespace pelta::shell
