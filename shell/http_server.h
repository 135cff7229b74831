// The HTTP side of the shell: the JSON interface (Api), the event stream of
// each session as server-sent events, and the built front end as static files.
// The only part of the program that knows the HTTP library.
#pragma once

#include <chrono>
#include <memory>
#include <string>

namespace pelta::shell {

class Api;

struct HttpOptions {
    std::string address = "127.0.0.1";
    int port = 8080;      // 0: any free port
    std::string webRoot;  // the built front end; empty serves a notice page
    // How often an idle event stream is pinged; a closed tab shows up as a failed ping.
    std::chrono::milliseconds heartbeat{std::chrono::seconds(10)};
    size_t threads = 64;  // each open event stream holds one
    size_t maxBody = 1 << 20;
    // How long a client may take to send a request.
    std::chrono::seconds readTimeout{10};
};

class HttpServer {
public:
    HttpServer(Api& api, HttpOptions options);
    ~HttpServer();
    HttpServer(const HttpServer&) = delete;
    HttpServer& operator=(const HttpServer&) = delete;

    // Binds the address; answers the port. Raises pelta::Error when it cannot.
    int bind();
    // Serves until stop(); call after bind().
    void run();
    // Ends the event streams and the server; safe from any thread.
    void stop();

private:
    struct Impl;
    std::unique_ptr<Impl> impl_;
};

}  // namespace pelta::shell
