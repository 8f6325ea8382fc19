// SPDX-License-Identifier: Apache-2.0
/// One session: a scene, its document and its picture, on a thread of its own.
#pragma once

#include "view/document.h"
#include "view/openScene.h"
#include "view/preview.h"
#include "view/request.h"
#include "view/turntable.h"

#include <condition_variable>
#include <deque>
#include <future>
#include <mutex>
#include <thread>

namespace zsi::view {

using PageId = std::uint64_t;
constexpr PageId kAllPages = 0;

/// Where the session's news go; called from its thread.
class Audience {
public:
    virtual ~Audience() = default;
    virtual void tell(PageId page, Json const& message) = 0;
    virtual void send(PageId page, Band binary) = 0;
    virtual void show(std::vector<LayerUpdate> updates) = 0;
};

/// A file for a page that asked for one; `status` as of HTTP.
struct Reply {
    int status = 200;
    std::string type, body;
    std::string saveAs = {}; ///< not empty: a name to save it under
};

struct StudioOptions {
    std::string version;
    std::filesystem::path saveFolder; ///< empty: nothing is saved
    std::function<Json(host::Shader const&)> describeClass;
    std::function<Json(std::vector<host::Shader> const&)> listClasses;
};

/// Everything but `post`, `ask` and the destructor happens on the session's thread, between two
/// stretches of rendering. A command that throws InputError changes nothing, and its page is told.
class Studio {
public:
    /// Loads the scene on the caller's thread; throws InputError.
    Studio(OpenedScene const& opened, host::ShaderSource const& shaders, StudioOptions options);
    ~Studio(); ///< ends the rendering within a sample
    Studio(Studio const&) = delete;
    Studio& operator=(Studio const&) = delete;

    std::vector<std::string> const& warnings() const { return warnings_; }
    void start(Audience& audience);

    void join(PageId page);
    void leave(PageId page);
    /// A message of a page; `handled` is called when it has been dealt with.
    void receive(PageId page, std::string const& text, std::function<void()> const& handled);
    /// Files: "picture.png", "scene.json", ...; `answer` is called from another thread.
    void ask(std::string name, Query query, std::function<void(Reply)> answer);

private:
    struct Slot { // NOLINT(bugprone-exception-escape): moving JSON does not throw
        Json document;
        std::vector<float> rgba;
        ShownPicture shown;
    };

    void run();
    void post(std::function<void()> command, bool changesScene);
    void render();
    void tellFrame(bool always);
    void denoiseWhenDue();

    void handle(PageId page, Json const& message);
    void edit(PageId page, std::vector<Edit> const& edits, std::string const& group);
    void goTo(PageId page, Json const& after, std::function<void()> const& commit);
    void undo(PageId page, bool again);
    void setView(Json const& message);
    void pick(PageId page, Json const& message);
    void inspect(PageId page, Json const& message);
    void keep(std::string const& slot);
    void compare(PageId page, Json const& message);
    void save(PageId page, std::string const& path);
    void tellScene(PageId page, std::vector<std::string> const& warnings);
    Json sceneMaterials() const;
    Json classJson(std::string const& name) const;
    Slot now() const;
    void layersChanged();
    void restart();
    Reply answer(std::string const& name, Query const& query);
    std::filesystem::path fileForPages(std::string const& file) const;
    std::function<Reply()> thumbnail(Query const& query) const;
    std::function<Reply()> measurement(Query const& query) const;

    host::ShaderSource const& shaders_;
    StudioOptions options_;
    std::filesystem::path file_;
    std::vector<std::string> warnings_;
    Document document_;
    LiveScene live_;
    Preview preview_;
    Audience* audience_ = nullptr;

    std::map<PageId, std::string> layerOf_;
    std::map<std::string, Slot> slots_;
    std::optional<Turntable> turntable_;
    std::vector<std::string> turntablePictures_;
    std::uint64_t revision_ = 1;
    bool denoise_ = false, isPaused_ = false;
    std::uint32_t denoisedAt_ = 0; ///< samples
    struct Denoising {
        std::uint32_t generation, samples;
        std::future<std::optional<host::Layer>> result;
    };
    std::atomic<bool> stopDenoising_{false};
    std::optional<Denoising> denoising_;
    std::chrono::steady_clock::time_point lastFrame_{};
    std::uint32_t told_ = 0; ///< generation

    std::mutex lock_;
    std::condition_variable wake_;
    std::deque<std::function<void()>> queue_;
    bool stop_ = false;
    /// Set while commands wait: the one for those that change the scene, the other for questions.
    std::atomic<bool> cancel_{false}, pause_{false};
    std::atomic<bool> stopAnswers_{false};
    std::vector<std::future<void>> answers_; ///< being made beside the rendering
    std::thread thread_;
};

} // namespace zsi::view
