// SPDX-License-Identifier: Apache-2.0
#include "view/server.h"

#include "base/error.h"
#include "view/page.h"
#include "view/pageFiles.h"
#include "view/request.h"

#include <algorithm>
#include <boost/asio/io_context.hpp>
#include <boost/asio/post.hpp>
#include <boost/asio/signal_set.hpp>
#include <boost/asio/steady_timer.hpp>
#include <boost/beast/http.hpp>
#include <fmt/format.h>

namespace zsi::view {
namespace {

namespace asio = boost::asio;
namespace beast = boost::beast;
namespace http = beast::http;
using tcp = asio::ip::tcp;
using std::chrono::milliseconds;
using std::chrono::seconds;

constexpr std::size_t kMostConnections = 256, kMostPages = 32;
constexpr std::uint32_t kLongestHeader = 16 << 10;
constexpr auto kRequestTime = seconds(10);
constexpr auto kEndTime = milliseconds(300);

constexpr char kPolicy[] =
    "default-src 'self'; connect-src 'self' ws:; img-src 'self' blob: data:; "
    "style-src 'self' 'unsafe-inline'; frame-ancestors 'none'; "
    "base-uri 'none'; form-action 'none'";

} // namespace

struct Server::Impl : Audience {
    asio::io_context context{1};
    tcp::acceptor acceptor{context};
    std::string token = newToken();
    Studio* studio = nullptr;
    Shown shown;
    std::map<PageId, std::shared_ptr<Page>> pages;
    PageId lastPage = kAllPages;
    std::size_t connections = 0;
    bool isAccepting = false, isEnding = false;
    asio::steady_timer retry{context};

    class Connection;
    void accept();
    void openPage(beast::tcp_stream stream, http::request<http::empty_body> const& request);
    void end();

    // From the session's thread: the rest happens on this one's.
    void tell(PageId page, Json const& message) override
    {
        bool const isFrame = message["type"] == "frame";
        // Names may hold what is no UTF-8.
        auto const text = std::make_shared<std::string const>(
            message.dump(-1, ' ', false, Json::error_handler_t::replace));
        asio::post(context, [this, page, text, isFrame] {
            for (auto const& [id, open] : pages)
                if (page == kAllPages || page == id)
                    open->tell(text, isFrame);
        });
    }
    void send(PageId page, Band binary) override
    {
        asio::post(context, [this, page, binary = std::move(binary)] {
            if (auto const open = pages.find(page); open != pages.end())
                open->second->send(binary);
        });
    }
    void show(std::vector<LayerUpdate> updates) override
    {
        asio::post(context, [this, updates = std::move(updates)] {
            for (LayerUpdate const& update : updates) {
                LayerUpdate& there = shown[update.layer];
                bool const isNew = there.generation != update.generation
                    || there.width != update.width || there.height != update.height;
                if (isNew)
                    there = update;
                else
                    for (auto const& [number, band] : update.bands)
                        there.bands[number] = band;
                for (auto const& [id, open] : pages)
                    open->updated(update, isNew);
            }
        });
    }
};

/// One HTTP connection, until it becomes a page or ends.
class Server::Impl::Connection : public std::enable_shared_from_this<Connection> {
public:
    Connection(tcp::socket socket, Impl& server)
        : stream_(std::move(socket))
        , server_(server)
    {
        ++server_.connections;
    }
    ~Connection()
    {
        --server_.connections;
        server_.accept();
    }
    Connection(Connection const&) = delete;
    Connection& operator=(Connection const&) = delete;

    void read()
    {
        parser_.emplace();
        parser_->header_limit(kLongestHeader);
        parser_->body_limit(0);
        stream_.expires_after(kRequestTime);
        http::async_read(stream_, buffer_, *parser_,
                         [self = shared_from_this()](beast::error_code error, std::size_t) {
                             self->received(error);
                         });
    }

private:
    void received(beast::error_code error)
    {
        if (error == http::error::header_limit || error == http::error::body_limit)
            return answer({413, "text/plain", "the request is too large\n"}, false);
        if (error == http::error::end_of_stream)
            return;
        if (error.category() == beast::error_code(http::error::bad_method).category())
            return answer({400, "text/plain", "this is no HTTP\n"}, false);
        if (!error) // else it is gone, or was too slow
            respond();
    }

    void respond()
    {
        auto const& request = parser_->get();
        bool const goesOn = request.keep_alive();
        auto const text = [](beast::string_view v) { return std::string_view(v.data(), v.size()); };
        std::string_view const host = text(request[http::field::host]);
        if (!isOwnHost(host, server_.acceptor.local_endpoint().port()))
            return answer({403, "text/plain", "this server has another name\n"}, goesOn);
        if (!isOwnOrigin(text(request[http::field::origin]), host))
            return answer({403, "text/plain", "pages of other sites are not served\n"}, goesOn);
        if (request.method() != http::verb::get && request.method() != http::verb::head)
            return answer({405, "text/plain", "only GET is served\n"}, goesOn);
        Target target = parseTarget(text(request.target()));
        bool const isFront = target.path == "/";
        std::string_view const name =
            isFront ? "index.html" : std::string_view(target.path).substr(1);
        auto const files = pageFiles();
        auto const file = std::find_if(files.begin(), files.end(),
                                       [&](PageFile const& f) { return f.name == name; });
        // What is the same in every installation is no secret.
        if (!isFront && file != files.end())
            return answer({200, mimeType(name), std::string(file->bytes)}, goesOn);
        if (!isSameToken(valueOf(target.query, "token"), server_.token))
            return answer(
                {403, "text/plain",
                 "the token is missing or wrong; open the address that zsi view prints\n"},
                goesOn);
        if (isFront && file == files.end())
            return answer({200, "text/plain", "this build of zsi has no page\n"}, goesOn);
        if (isFront)
            return answer({200, mimeType(name), std::string(file->bytes)}, goesOn);
        if (target.path == "/session") {
            if (!beast::websocket::is_upgrade(request))
                return answer({426, "text/plain", "this address speaks WebSocket\n"}, goesOn);
            if (server_.pages.size() >= kMostPages)
                return answer({503, "text/plain", "too many pages are open\n"}, false);
            return server_.openPage(std::move(stream_), request);
        }
        stream_.expires_never(); // the picture may take its time
        server_.studio->ask(std::string(name), std::move(target.query),
                            [self = shared_from_this(), goesOn](Reply reply) mutable {
                                asio::post(self->server_.context,
                                           [self, goesOn, reply = std::move(reply)]() mutable {
                                               self->answer(std::move(reply), goesOn);
                                           });
                            });
    }

    void answer(Reply reply, bool goesOn)
    {
        response_.emplace(static_cast<http::status>(reply.status), 11);
        response_->set(http::field::content_type, reply.type);
        response_->set(http::field::cache_control, "no-store");
        response_->set("Content-Security-Policy", kPolicy);
        response_->set("X-Content-Type-Options", "nosniff");
        response_->set("Referrer-Policy", "no-referrer");
        response_->set("Cross-Origin-Resource-Policy", "same-origin");
        if (reply.status == 405)
            response_->set(http::field::allow, "GET");
        if (!reply.saveAs.empty()) {
            std::replace_if(
                reply.saveAs.begin(), reply.saveAs.end(),
                [](char c) { return c == '"' || c == '\\' || static_cast<unsigned char>(c) < 32; },
                '_');
            response_->set(http::field::content_disposition,
                           "attachment; filename=\"" + reply.saveAs + '"');
        }
        response_->keep_alive(goesOn);
        response_->body() = std::move(reply.body);
        response_->prepare_payload();
        if (parser_->get().method() == http::verb::head)
            response_->body().clear();
        stream_.expires_after(seconds(60));
        http::async_write(
            stream_, *response_,
            [self = shared_from_this(), goesOn](beast::error_code error, std::size_t) {
                if (!error && goesOn)
                    return self->read();
                beast::error_code ignored;
                self->stream_.socket().shutdown(tcp::socket::shutdown_send, ignored);
            });
    }

    beast::tcp_stream stream_;
    Impl& server_;
    beast::flat_buffer buffer_;
    std::optional<http::request_parser<http::empty_body>> parser_;
    std::optional<http::response<http::string_body>> response_;
};

void Server::Impl::accept()
{
    if (isAccepting || isEnding || connections >= kMostConnections)
        return;
    isAccepting = true;
    acceptor.async_accept([this](beast::error_code error, tcp::socket socket) {
        isAccepting = false;
        if (isEnding)
            return;
        if (error) { // no descriptors left: some will be free again
            retry.expires_after(milliseconds(100));
            retry.async_wait([this](beast::error_code) { accept(); });
            return;
        }
        beast::error_code ignored;
        socket.set_option(tcp::no_delay(true), ignored);
        std::make_shared<Connection>(std::move(socket), *this)->read();
        accept();
    });
}

void Server::Impl::openPage(beast::tcp_stream stream,
                            http::request<http::empty_body> const& request)
{
    PageId const id = ++lastPage;
    auto const page = std::make_shared<Page>(
        std::move(stream), shown,
        Page::Events{[this, id](std::string const& text) {
                         studio->receive(id, text, [this, id] {
                             asio::post(context, [this, id] {
                                 if (auto const open = pages.find(id); open != pages.end())
                                     open->second->handled();
                             });
                         });
                     },
                     [this, id] {
                         pages.erase(id);
                         studio->leave(id);
                     }});
    pages[id] = page;
    page->accept(request);
    studio->join(id);
}

/// Tells the pages and gives them a moment.
void Server::Impl::end()
{
    if (std::exchange(isEnding, true))
        return context.stop();
    acceptor.close();
    for (auto const& [id, page] : pages)
        page->close("zsi view has ended");
    retry.expires_after(kEndTime);
    retry.async_wait([this](beast::error_code) { context.stop(); });
}

Server::Server(ServerOptions const& options)
    : impl_(std::make_unique<Impl>())
{
    beast::error_code error;
    auto const address = asio::ip::make_address(options.address, error);
    tcp::endpoint const endpoint(address, options.port);
    tcp::acceptor& acceptor = impl_->acceptor;
    if (!error)
        acceptor.open(endpoint.protocol(), error);
    if (!error)
        acceptor.set_option(tcp::acceptor::reuse_address(true), error);
    if (!error)
        acceptor.bind(endpoint, error);
    if (!error)
        acceptor.listen(tcp::acceptor::max_listen_connections, error);
    if (error)
        throw host::InputError(fmt::format("cannot listen on {} port {}: {}", options.address,
                                           options.port, error.message()));
}

Server::~Server() = default;

std::string Server::url() const
{
    tcp::endpoint const here = impl_->acceptor.local_endpoint();
    bool const isV6 = here.address().is_v6();
    return fmt::format("http://{}{}{}:{}/?token={}", isV6 ? "[" : "", here.address().to_string(),
                       isV6 ? "]" : "", here.port(), impl_->token);
}

bool Server::isLoopback() const { return impl_->acceptor.local_endpoint().address().is_loopback(); }

void Server::run(Studio& studio)
{
    impl_->studio = &studio;
    asio::signal_set signals(impl_->context, SIGINT, SIGTERM, SIGHUP);
    signals.async_wait([this](beast::error_code error, int) {
        if (!error)
            impl_->end();
    });
    studio.start(*impl_);
    impl_->accept();
    impl_->context.run();
}

} // namespace zsi::view
