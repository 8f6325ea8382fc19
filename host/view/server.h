// SPDX-License-Identifier: Apache-2.0
/// A session to web pages: HTTP and WebSocket (docs/view.md).
#pragma once

#include "view/studio.h"

namespace zsi::view {

struct ServerOptions {
    std::string address = "127.0.0.1";
    unsigned short port = 0; ///< 0: any that is free
};

/// Serves from its constructor on: throws InputError where it cannot listen.
class Server {
public:
    explicit Server(ServerOptions const& options);
    ~Server();
    Server(Server const&) = delete;
    Server& operator=(Server const&) = delete;

    /// With the token, without which pages are turned away.
    std::string url() const;
    bool isLoopback() const;
    /// Serves the session until SIGINT, SIGTERM or SIGHUP.
    void run(Studio& studio);

private:
    struct Impl;
    std::unique_ptr<Impl> impl_;
};

} // namespace zsi::view
