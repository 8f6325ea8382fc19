// SPDX-License-Identifier: Apache-2.0
/// One open page: its WebSocket, and what is on the way to it.
#pragma once

#include "view/preview.h"

#include <boost/asio/ip/tcp.hpp>
#include <boost/beast/core.hpp>
#include <boost/beast/http/empty_body.hpp>
#include <boost/beast/http/message.hpp>
#include <boost/beast/websocket.hpp>
#include <deque>
#include <functional>
#include <memory>

namespace zsi::view {

/// The newest rows of each layer that pages look at.
using Shown = std::map<std::string, LayerUpdate>;

/// All calls on the server's thread. What a page does not take waits here and no more than one
/// picture of it: of rows that are overtaken only the newest are sent. A page that leaves too many
/// other messages unread is closed.
class Page : public std::enable_shared_from_this<Page> {
public:
    struct Events {
        std::function<void(std::string text)> message; ///< answer with `handled`
        std::function<void()> closed;
    };
    Page(boost::beast::tcp_stream stream, Shown const& shown, Events events);

    void accept(boost::beast::http::request<boost::beast::http::empty_body> const& request);
    void tell(Band text, bool isFrame); ///< of `frame` messages only the newest waits
    void send(Band binary);
    void handled(); ///< a message has been dealt with
    void updated(LayerUpdate const& update, bool isNew); ///< rows of a layer are in `shown`
    void close(std::string reason);

private:
    struct Message {
        Band bytes;
        bool isText, isFrame;
    };
    void read();
    void take(std::string text);
    void look(std::string layer);
    void queue(Message message);
    void write();
    void end();

    boost::beast::websocket::stream<boost::beast::tcp_stream> socket_;
    boost::beast::flat_buffer buffer_;
    Shown const& shown_;
    Events events_;
    std::string layer_ = "beauty";
    std::set<std::size_t> dirty_; ///< bands of the layer that the page has not got
    std::deque<Message> queue_;
    std::size_t queued_ = 0; ///< bytes
    std::size_t unacknowledged_ = 0; ///< bytes of bands
    int unhandled_ = 0;
    bool isOpen_ = false, isWriting_ = false, isReading_ = false, isClosing_ = false;
    Band writing_;
};

} // namespace zsi::view
