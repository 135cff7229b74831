#include "shell/downloads.h"

#include <sys/stat.h>

#include <algorithm>
#include <cstdlib>
#include <fstream>
#include <iterator>
#include <nlohmann/json.hpp>
#include <system_error>

#include "shell/event_channel.h"
#include "shell/log.h"
#include "shell/session.h"

namespace pelta::shell {

namespace fs = std::filesystem;

std::string safeDownloadName(const std::string& fileName) {
    std::string name = fileName;
    if (auto slash = name.find_last_of("/\\"); slash != std::string::npos) name.erase(0, slash + 1);
    for (char& ch : name)
        if (static_cast<unsigned char>(ch) < 0x20 || ch == 0x7F || ch == ':') ch = '_';
    if (name.size() > 120) {
        size_t cut = 120;
        while (cut > 0 && (static_cast<unsigned char>(name[cut]) & 0xC0) == 0x80)
            --cut;  // not inside a UTF-8 character
        name.resize(cut);
    }
    if (name.empty() || name == "." || name == "..") name = "download";
    return name;
}

std::string attachmentDisposition(const std::string& name) {
    std::string ascii;
    std::string encoded;
    static const char* kHex = "0123456789ABCDEF";
    for (char ch : name) {
        const auto c = static_cast<unsigned char>(ch);
        ascii += c < 0x20 || c >= 0x7F || ch == '"' || ch == '\\' ? '_' : ch;
        const bool plain = (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z') ||
                           (c >= '0' && c <= '9') || ch == '.' || ch == '-' || ch == '_';
        if (plain) {
            encoded += ch;
        } else {
            encoded += '%';
            encoded += kHex[c >> 4];
            encoded += kHex[c & 15];
        }
    }
    return "attachment; filename=\"" + ascii + "\"; filename*=UTF-8''" + encoded;
}

Downloads::Downloads(EventChannel& events) : events_(events) {}

Downloads::~Downloads() {
    std::lock_guard lock(mutex_);
    if (root_.empty()) return;
    std::error_code ec;
    fs::remove_all(root_, ec);
}

void Downloads::discard(const Entry& e) {
    std::error_code ec;
    fs::remove_all(e.path.parent_path(), ec);
}

std::optional<fs::path> Downloads::reserve(const std::string& fileName) {
    std::lock_guard lock(mutex_);
    std::error_code ec;
    if (root_.empty()) {
        std::string pattern = (fs::temp_directory_path(ec) / "pelta-downloads-XXXXXX").string();
        if (ec || !mkdtemp(pattern.data())) {
            logLine("no folder for downloads: " + pattern);
            return std::nullopt;
        }
        root_ = pattern;
    }
    Entry e;
    e.token = newSessionId();
    e.name = safeDownloadName(fileName);
    const fs::path folder = root_ / e.token;
    if (mkdir(folder.c_str(), 0700) != 0) return std::nullopt;
    e.path = folder / e.name;
    reserved_.push_back(e);
    return e.path;
}

void Downloads::offer() {
    std::vector<Entry> offered;
    {
        std::lock_guard lock(mutex_);
        for (Entry& e : reserved_) {
            std::error_code ec;
            const bool written = fs::is_regular_file(fs::symlink_status(e.path, ec));
            const uintmax_t size = written ? fs::file_size(e.path, ec) : 0;
            if (!written || ec || size > kMaxBytes) {
                if (written)
                    logLine("a download of " + std::to_string(size) + " bytes is too large");
                discard(e);
                continue;
            }
            waiting_.push_back(e);
            offered.push_back(e);
        }
        reserved_.clear();
        while (waiting_.size() > kMaxWaiting) {
            discard(waiting_.front());
            waiting_.erase(waiting_.begin());
        }
    }
    for (const Entry& e : offered) {
        std::error_code ec;
        const uintmax_t size = fs::file_size(e.path, ec);
        events_.publish(
            "download",
            nlohmann::json{{"token", e.token}, {"name", e.name}, {"size", ec ? 0 : size}}.dump(
                -1, ' ', false, nlohmann::json::error_handler_t::replace));
    }
}

std::optional<Downloads::File> Downloads::take(const std::string& token) {
    Entry e;
    {
        std::lock_guard lock(mutex_);
        auto it = std::find_if(waiting_.begin(), waiting_.end(),
                               [&](const Entry& w) { return w.token == token; });
        if (it == waiting_.end()) return std::nullopt;
        e = *it;
        waiting_.erase(it);
    }
    File f;
    f.name = e.name;
    std::ifstream in(e.path, std::ios::binary);
    f.bytes.assign(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    const bool read = static_cast<bool>(in) || in.eof();
    discard(e);
    if (!read) return std::nullopt;
    return f;
}

}  // namespace pelta::shell
