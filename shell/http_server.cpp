#include "shell/http_server.h"

#include <httplib.h>

#include <atomic>
#include <filesystem>

#include "platform/automation/error.h"
#include "shell/api.h"
#include "shell/log.h"
#include "shell/session.h"

namespace pelta::shell {

namespace {

constexpr const char* kJson = "application/json; charset=utf-8";

const char* kNoFrontEnd =
    "<!doctype html><meta charset=utf-8><title>pelta</title>"
    "<p>The front end is not built. Run <code>npm ci &amp;&amp; npm run build</code> in "
    "<code>shell/web</code>, or start pelta with <code>--web DIR</code>.</p>";

std::string cookieValue(const httplib::Request& req, const std::string& name) {
    std::string cookies = req.get_header_value("Cookie");
    size_t pos = 0;
    while (pos < cookies.size()) {
        size_t end = cookies.find(';', pos);
        if (end == std::string::npos) end = cookies.size();
        std::string part = cookies.substr(pos, end - pos);
        size_t start = part.find_first_not_of(' ');
        if (start != std::string::npos) part.erase(0, start);
        if (part.size() > name.size() && part.compare(0, name.size(), name) == 0 &&
            part[name.size()] == '=')
            return part.substr(name.size() + 1);
        pos = end + 1;
    }
    return {};
}

std::string sessionIdOf(const httplib::Request& req) {
    if (req.has_header("X-Pelta-Session")) return req.get_header_value("X-Pelta-Session");
    if (req.has_param("session")) return req.get_param_value("session");
    return cookieValue(req, "pelta_session");
}

uint64_t lastEventId(const httplib::Request& req) {
    std::string text = req.has_header("Last-Event-ID") ? req.get_header_value("Last-Event-ID")
                                                       : req.get_param_value("after");
    if (text.empty() || text.size() > 18) return 0;
    uint64_t v = 0;
    for (char c : text) {
        if (c < '0' || c > '9') return 0;
        v = v * 10 + static_cast<uint64_t>(c - '0');
    }
    return v;
}

}  // namespace

struct HttpServer::Impl {
    Api& api;
    HttpOptions options;
    httplib::Server server;
    std::atomic<bool> stopping{false};

    Impl(Api& a, HttpOptions o) : api(a), options(std::move(o)) {}

    void forward(const httplib::Request& req, httplib::Response& res) {
        ApiRequest r;
        r.method = req.method;
        r.path = req.path;
        for (const auto& [k, v] : req.params)
            r.query.emplace(k, v);
        r.body = req.body;
        r.sessionId = sessionIdOf(req);
        ApiResponse a = api.handle(r);
        res.status = a.status;
        if (!a.setCookie.empty()) res.set_header("Set-Cookie", a.setCookie);
        res.set_header("Cache-Control", "no-store");
        if (!a.disposition.empty()) res.set_header("Content-Disposition", a.disposition);
        res.set_content(a.body, a.contentType.empty() ? kJson : a.contentType.c_str());
    }

    void events(const httplib::Request& req, httplib::Response& res) {
        auto session = api.sessionOf(sessionIdOf(req));
        res.set_header("Cache-Control", "no-store");
        if (!session) {
            res.status = 401;
            res.set_content(errorBody(401, "No session; start one first"), kJson);
            return;
        }
        uint64_t after = lastEventId(req);
        session->events().attach();
        auto heartbeat = options.heartbeat;
        res.set_header("X-Accel-Buffering", "no");
        res.set_chunked_content_provider(
            "text/event-stream",
            [this, session, after, heartbeat, first = true](size_t,
                                                            httplib::DataSink& sink) mutable {
                if (first) {
                    first = false;
                    std::string hello = "retry: 2000\n: connected\n\n";
                    return sink.write(hello.data(), hello.size());
                }
                if (stopping) return false;
                EventChannel& channel = session->events();
                std::vector<Event> events = channel.waitAfter(after, heartbeat);
                for (const Event& e : events) {
                    std::string text = formatServerSentEvent(e);
                    if (!sink.write(text.data(), text.size())) return false;
                    after = e.sequence;
                }
                if (channel.closed() && channel.lastSequence() <= after) {
                    sink.done();
                    return true;
                }
                if (events.empty()) {
                    // A ping: writing to a closed tab fails, which ends the stream.
                    static const std::string ping = ": ping\n\n";
                    return sink.write(ping.data(), ping.size());
                }
                return true;
            },
            [session](bool) {
                session->events().detach();
                session->touch();  // the idle time of a closed tab starts now
            });
    }

    void setUp() {
        server.new_task_queue = [n = options.threads] { return new httplib::ThreadPool(n); };
        server.set_payload_max_length(options.maxBody);
        server.set_keep_alive_timeout(5);
        server.set_read_timeout(static_cast<time_t>(options.readTimeout.count()));
        server.set_write_timeout(10);
        server.set_default_headers({{"X-Content-Type-Options", "nosniff"},
                                    {"Referrer-Policy", "no-referrer"},
                                    {"X-Frame-Options", "DENY"}});

        server.Get("/api/events", [this](const auto& req, auto& res) { events(req, res); });
        auto api = [this](const httplib::Request& req, httplib::Response& res) {
            forward(req, res);
        };
        server.Get("/api/.*", api);
        server.Post("/api/.*", api);
        server.Delete("/api/.*", api);
        server.Put("/api/.*", api);
        server.Patch("/api/.*", api);

        bool haveWeb =
            !options.webRoot.empty() &&
            std::filesystem::is_regular_file(std::filesystem::path(options.webRoot) / "index.html");
        if (haveWeb) {
            server.set_mount_point("/", options.webRoot);
            server.set_file_extension_and_mimetype_mapping("js", "text/javascript");
            server.set_file_extension_and_mimetype_mapping("mjs", "text/javascript");
        } else {
            logLine("no front end in \"" + options.webRoot + "\": serving a notice page");
            server.Get("/",
                       [](const auto&, auto& res) { res.set_content(kNoFrontEnd, "text/html"); });
        }

        server.set_error_handler([](const httplib::Request& req, httplib::Response& res) {
            if (!res.body.empty()) return;
            std::string message = res.status == 404   ? "No such resource"
                                  : res.status == 413 ? "The request is too large"
                                  : res.status == 400 ? "Bad request"
                                                      : "Request failed";
            res.set_content(errorBody(res.status, message), kJson);
        });
        server.set_exception_handler([](const auto& req, auto& res, std::exception_ptr) {
            logLine("request " + req.method + " " + req.path + " failed");
            res.status = 500;
            res.set_content(errorBody(500, "Internal error"), kJson);
        });
    }
};

HttpServer::HttpServer(Api& api, HttpOptions options)
    : impl_(std::make_unique<Impl>(api, std::move(options))) {
    impl_->setUp();
}

HttpServer::~HttpServer() {
    stop();
}

int HttpServer::bind() {
    auto& o = impl_->options;
    int port = o.port;
    if (port == 0) {
        port = impl_->server.bind_to_any_port(o.address);
        if (port < 0) port = 0;
    } else if (!impl_->server.bind_to_port(o.address, port)) {
        port = 0;
    }
    if (port <= 0)
        pelta::raise(pelta::errc::Fail,
                     "Cannot listen on " + o.address + ":" + std::to_string(o.port), "pelta.shell");
    return port;
}

void HttpServer::run() {
    impl_->server.listen_after_bind();
}

void HttpServer::stop() {
    impl_->stopping = true;
    impl_->server.stop();
}

}  // namespace pelta::shell
