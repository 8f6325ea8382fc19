// SPDX-License-Identifier: Apache-2.0
#include "view/page.h"

#include <algorithm>

namespace zsi::view {
namespace {

namespace beast = boost::beast;
namespace websocket = beast::websocket;
using std::chrono::seconds;

constexpr std::size_t kLongestMessage = 1 << 20;
constexpr std::size_t kMostQueued = 32 << 20, kMostMessages = 1000;
/// Bytes of pictures on the way to a page that it has not told to have taken.
constexpr std::size_t kLeastWindow = 8 << 20;
/// Messages of a page that wait for the renderer; it is not read on until they are fewer.
constexpr int kMostUnhandled = 64;

/// A value of one of the two short messages that concern the connection alone.
std::string typeOf(Json const& message)
{
    auto const type = message.is_object() ? message.find("type") : message.end();
    return type != message.end() && type->is_string() ? type->get<std::string>() : std::string();
}

} // namespace

Page::Page(beast::tcp_stream stream, Shown const& shown, Events events)
    : socket_(std::move(stream))
    , shown_(shown)
    , events_(std::move(events))
{
}

void Page::accept(beast::http::request<beast::http::empty_body> const& request)
{
    socket_.next_layer().expires_never(); // the stream has timeouts of its own
    websocket::stream_base::timeout timeout{};
    timeout.handshake_timeout = seconds(10);
    timeout.idle_timeout = seconds(60);
    timeout.keep_alive_pings = true;
    socket_.set_option(timeout);
    socket_.read_message_max(kLongestMessage);
    socket_.auto_fragment(false); // what is sent is in memory whole
    socket_.async_accept(request, [self = shared_from_this()](beast::error_code error) {
        if (error)
            return self->end();
        self->isOpen_ = true;
        self->look(self->layer_);
        self->read();
        self->write();
    });
}

void Page::read()
{
    if (isReading_ || !isOpen_ || unhandled_ >= kMostUnhandled)
        return;
    isReading_ = true;
    socket_.async_read(buffer_, [self = shared_from_this()](beast::error_code error, std::size_t) {
        self->isReading_ = false;
        if (error)
            return self->end();
        bool const isText = self->socket_.got_text();
        std::string text = beast::buffers_to_string(self->buffer_.data());
        self->buffer_.consume(self->buffer_.size());
        if (isText)
            self->take(std::move(text));
        self->read();
    });
}

void Page::take(std::string text)
{
    // Two kinds of message are short and frequent or concern the connection alone.
    if (text.size() < 256) {
        Json const message = Json::parse(text, nullptr, false);
        std::string const type = typeOf(message);
        if (type == "ack") {
            Json const bytes = message.value("bytes", Json());
            std::size_t const taken = bytes.is_number_unsigned() ? bytes.get<std::size_t>() : 0;
            unacknowledged_ -= std::min(unacknowledged_, taken);
            return write();
        }
        if (type == "layer" && message.value("name", Json()).is_string())
            look(message["name"]);
    }
    ++unhandled_;
    events_.message(std::move(text));
}

void Page::handled()
{
    --unhandled_;
    read();
}

void Page::look(std::string layer)
{
    layer_ = std::move(layer);
    dirty_.clear();
    auto const shown = shown_.find(layer_);
    if (shown != shown_.end())
        for (auto const& [number, band] : shown->second.bands)
            dirty_.insert(number);
    write();
}

void Page::updated(LayerUpdate const& update, bool isNew)
{
    if (update.layer != layer_)
        return;
    if (isNew)
        dirty_.clear();
    for (auto const& [number, band] : update.bands)
        dirty_.insert(number);
    write();
}

void Page::tell(Band text, bool isFrame) { queue({std::move(text), true, isFrame}); }

void Page::send(Band binary) { queue({std::move(binary), false, false}); }

void Page::queue(Message message)
{
    if (isClosing_)
        return;
    if (message.isFrame && !queue_.empty() && queue_.back().isFrame) {
        queued_ -= queue_.back().bytes->size();
        queue_.pop_back();
    }
    queued_ += message.bytes->size();
    queue_.push_back(std::move(message));
    if (queued_ > kMostQueued || queue_.size() > kMostMessages)
        return beast::get_lowest_layer(socket_).close(); // its reads end, and so does the page
    write();
}

void Page::write()
{
    if (isWriting_ || !isOpen_)
        return;
    auto const shown = shown_.find(layer_);
    std::size_t const picture = shown == shown_.end()
        ? 0
        : 4 * static_cast<std::size_t>(shown->second.width)
            * static_cast<std::size_t>(shown->second.height);
    bool isText = false;
    if (!queue_.empty()) {
        writing_ = std::move(queue_.front().bytes);
        isText = queue_.front().isText;
        queue_.pop_front();
        queued_ -= writing_->size();
    } else if (!dirty_.empty() && shown != shown_.end()
               && unacknowledged_ < std::max(kLeastWindow, 2 * picture)) {
        auto const band = shown->second.bands.find(*dirty_.begin());
        dirty_.erase(dirty_.begin());
        if (band == shown->second.bands.end())
            return write();
        writing_ = band->second;
        unacknowledged_ += writing_->size();
    } else {
        if (std::exchange(isClosing_, isClosing_) && queue_.empty())
            socket_.async_close(websocket::close_code::going_away,
                                [self = shared_from_this()](beast::error_code) {});
        return;
    }
    isWriting_ = true;
    socket_.text(isText);
    socket_.async_write(boost::asio::buffer(*writing_),
                        [self = shared_from_this()](beast::error_code error, std::size_t) {
                            self->isWriting_ = false;
                            if (error)
                                return self->end();
                            self->write();
                        });
}

void Page::close(std::string reason)
{
    dirty_.clear();
    tell(std::make_shared<std::string const>(
             Json({{"type", "bye"}, {"reason", std::move(reason)}}).dump()),
         false);
    isClosing_ = true;
    write();
}

void Page::end()
{
    isOpen_ = false;
    beast::get_lowest_layer(socket_).close();
    if (auto const closed = std::exchange(events_.closed, {}))
        closed();
}

} // namespace zsi::view
