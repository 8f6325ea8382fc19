// SPDX-License-Identifier: Apache-2.0
#include "film/filmFile.h"

#include "base/error.h"
#include "base/replacedFile.h"
#include "texture/exrCheck.h"

#include <OpenImageIO/filesystem.h>
#include <OpenImageIO/hash.h>
#include <OpenImageIO/imageio.h>
#include <fmt/format.h>
#include <map>
#include <nlohmann/json.hpp>

namespace zsi::host {
namespace {

using Json = nlohmann::json;
using Words = std::vector<std::uint32_t>;

constexpr char const* kLayers = "zsi:layers";
constexpr char const* kDigest = "zsi:digest";
constexpr int kMostSide = 32768; ///< pixels; what claims more is no picture

std::string layersText(Film const& film)
{
    Json layers = Json::array();
    for (LayerFormat const& l : film.layers())
        layers.push_back({{"name", l.name},
                          {"channels", l.channels},
                          {"value", static_cast<int>(l.value)},
                          {"half", l.half}});
    return layers.dump();
}

std::vector<LayerFormat> layersOf(std::string const& text)
{
    std::vector<LayerFormat> layers;
    for (Json const& l : Json::parse(text))
        layers.push_back({l.at("name").get<std::string>(),
                          l.at("channels").get<std::vector<std::string>>(),
                          static_cast<LayerFormat::Value>(l.at("value").get<int>()),
                          l.at("half").get<std::string>()});
    return layers;
}

/// The most names of one pixel in each layer of names.
std::vector<std::size_t> mostIds(Film const& film)
{
    std::vector<std::size_t> most;
    Window const& w = film.window();
    for (int y = w.y0; y < w.y1; ++y)
        for (int x = w.x0; x < w.x1; ++x) {
            auto const ids = film.state(x, y).ids;
            most.resize(ids.size());
            for (std::size_t i = 0; i < ids.size(); ++i)
                most[i] = std::max(most[i], ids[i].size());
        }
    return most;
}

std::vector<std::string> channelNames(std::size_t sums, std::size_t counts,
                                      std::vector<std::size_t> const& ids)
{
    std::vector<std::string> names;
    for (std::size_t i = 0; i < sums; ++i)
        for (int word = 0; word < 3; ++word)
            names.push_back(fmt::format("sums.{}.{}", i, word));
    for (std::size_t i = 0; i < counts; ++i)
        names.push_back(fmt::format("counts.{}", i));
    for (std::size_t i = 0; i < ids.size(); ++i)
        for (std::size_t k = 0; k < ids[i]; ++k) {
            names.push_back(fmt::format("ids.{}.{}", i, k));
            names.push_back(fmt::format("shares.{}.{}", i, k));
        }
    return names;
}

/// All values of a row, pixel by pixel, in the order of `channelNames`.
void rowOf(Film const& film, int y, std::vector<std::size_t> const& most, Words& row)
{
    row.clear();
    for (int x = film.window().x0; x < film.window().x1; ++x) {
        auto const state = film.state(x, y);
        for (ExactSum const& sum : state.sums)
            for (int word = 0; word < 3; ++word)
                row.push_back(sum.word(word));
        row.insert(row.end(), state.counts.begin(), state.counts.end());
        for (std::size_t i = 0; i < most.size(); ++i)
            for (std::size_t k = 0; k < most[i]; ++k) {
                bool const has = k < state.ids[i].size();
                row.push_back(has ? state.ids[i][k].id : 0);
                row.push_back(has ? state.ids[i][k].count : 0);
            }
    }
}

/// Of a whole film: compression does not notice a bit that has turned.
class Digest {
public:
    void add(Words const& row) { add(row.data(), row.size() * sizeof(row[0])); }
    /// Place and texts of the file itself.
    void add(OIIO::ImageSpec const& spec)
    {
        add(Words{static_cast<std::uint32_t>(spec.x), static_cast<std::uint32_t>(spec.y),
                  static_cast<std::uint32_t>(spec.width), static_cast<std::uint32_t>(spec.height)});
        std::map<std::string, std::string> texts;
        for (OIIO::ParamValue const& line : spec.extra_attribs)
            if (line.name().string().starts_with("zsi:") && line.name() != kDigest)
                texts[line.name().string()] = line.get_string();
        for (auto const& [name, text] : texts) {
            add(name.data(), name.size());
            add(text.data(), text.size());
        }
    }
    std::string text() const { return fmt::format("{:016x}", sum_); }

private:
    void add(void const* data, std::size_t size)
    {
        sum_ = sum_ * 0x9e3779b97f4a7c15u
            + OIIO::farmhash::Hash64(static_cast<char const*>(data), size);
    }
    std::uint64_t sum_ = 0;
};

} // namespace

std::vector<unsigned char> filmBytes(Film const& film, std::vector<Attachment> const& label)
{
    Window const& w = film.window();
    auto const first = film.state(w.x0, w.y0);
    std::vector<std::size_t> const most = mostIds(film);
    OIIO::ImageSpec spec(w.width(), w.height(), 1, OIIO::TypeDesc::UINT32);
    spec.channelnames = channelNames(first.sums.size(), first.counts.size(), most);
    spec.nchannels = static_cast<int>(spec.channelnames.size());
    spec.x = w.x0;
    spec.y = w.y0;
    spec.full_width = film.frameWidth();
    spec.full_height = film.frameHeight();
    spec.attribute("compression",
                   "rle"); // high words are mostly 0; more takes longer than it saves
    spec.attribute("Software", "zsi");
    spec.attribute("DateTime", "");
    spec.attribute(kLayers, layersText(film));
    for (Attachment const& line : label)
        spec.attribute(line.name, line.text);

    Digest digest;
    digest.add(spec);
    Words row;
    for (int y = w.y0; y < w.y1; ++y) {
        rowOf(film, y, most, row);
        digest.add(row);
    }
    spec.attribute(kDigest, digest.text());

    auto const fail = [](std::string const& why) {
        throw InputError("the film cannot be written: " + why);
    };
    std::vector<unsigned char> bytes;
    OIIO::Filesystem::IOVecOutput memory(bytes);
    auto const output = OIIO::ImageOutput::create("film.exr");
    if (!output || !output->set_ioproxy(&memory) || !output->open("film.exr", spec))
        fail(output ? output->geterror() : OIIO::geterror());
    for (int y = w.y0; y < w.y1; ++y) {
        rowOf(film, y, most, row);
        if (!output->write_scanline(y, 0, OIIO::TypeDesc::UINT32, row.data()))
            fail(output->geterror());
    }
    if (!output->close())
        fail(output->geterror());
    return bytes;
}

void writeFilm(std::filesystem::path const& file, Film const& film,
               std::vector<Attachment> const& label)
{
    ReplacedFile goal(file);
    goal.write(filmBytes(film, label));
    goal.commit();
}

namespace {

InputError damaged(std::string const& name, std::string const& why)
{
    return InputError(name + ": is no film or a damaged one: " + why);
}

FilmHead headOf(std::string const& name, OIIO::ImageSpec const& spec)
{
    if (spec.format != OIIO::TypeDesc::UINT32)
        throw damaged(name, "its values are no integers");
    FilmHead head{spec.full_width,
                  spec.full_height,
                  {spec.x, spec.y, spec.x + spec.width, spec.y + spec.height},
                  {},
                  {}};
    if (spec.full_width > kMostSide || spec.full_height > kMostSide
        || intersection(head.window, {0, 0, spec.full_width, spec.full_height}) != head.window)
        throw damaged(name, "it lies outside of its picture");
    try {
        head.layers = layersOf(spec.get_string_attribute(kLayers));
    } catch (Json::exception const&) {
        throw damaged(name, "it does not tell its layers");
    }
    for (LayerFormat const& layer : head.layers)
        if (static_cast<unsigned>(layer.value) > static_cast<unsigned>(LayerFormat::Value::Ids))
            throw damaged(name, "it has a layer of unknown kind");
    for (OIIO::ParamValue const& line : spec.extra_attribs)
        if (line.type() == OIIO::TypeDesc::STRING)
            head.label.push_back({line.name().string(), line.get_string()});
    return head;
}

StoredFilm readFilm(std::string const& name, OIIO::ImageInput& input)
{
    OIIO::ImageSpec const& spec = input.spec();
    FilmHead head = headOf(name, spec);
    StoredFilm stored{Film(head.frameWidth, head.frameHeight, head.window, std::move(head.layers)),
                      std::move(head.label)};
    Film& film = stored.film;
    Window const& w = film.window();
    auto const first = film.state(w.x0, w.y0);
    std::vector<std::size_t> most(first.ids.size());
    for (std::size_t i = 0; i < most.size(); ++i)
        while (spec.channelindex(fmt::format("ids.{}.{}", i, most[i])) >= 0)
            ++most[i];
    std::vector<std::size_t> at; // of each value among the file's channels
    for (std::string const& value : channelNames(first.sums.size(), first.counts.size(), most)) {
        int const channel = spec.channelindex(value);
        if (channel < 0)
            throw damaged(name, "it lacks " + value);
        at.push_back(static_cast<std::size_t>(channel));
    }
    auto const channels = static_cast<std::size_t>(spec.nchannels);
    Words row(static_cast<std::size_t>(spec.width) * channels), ordered;
    Digest digest;
    digest.add(spec);
    for (int y = w.y0; y < w.y1; ++y) {
        if (!input.read_scanline(y, 0, OIIO::TypeDesc::UINT32, row.data()))
            throw damaged(name, input.geterror());
        ordered.clear();
        for (int x = w.x0; x < w.x1; ++x) {
            std::uint32_t const* const words = &row[static_cast<std::size_t>(x - w.x0) * channels];
            std::size_t next = 0;
            auto const take = [&] { return ordered.emplace_back(words[at[next++]]); };
            auto const state = film.state(x, y);
            for (ExactSum& sum : state.sums) {
                std::uint32_t const low = take(), middle = take(), high = take();
                sum = ExactSum::fromWords(low, middle, high);
            }
            for (std::uint32_t& count : state.counts)
                count = take();
            for (std::size_t i = 0; i < most.size(); ++i)
                for (std::size_t k = 0; k < most[i]; ++k) {
                    std::uint32_t const id = take(), count = take();
                    if (count > 0)
                        state.ids[i].push_back({id, count});
                }
        }
        digest.add(ordered);
    }
    if (digest.text() != labelText(stored.label, kDigest))
        throw damaged(name, "its values are not those that were written");
    return stored;
}

std::unique_ptr<OIIO::ImageInput> opened(std::string const& name,
                                         OIIO::Filesystem::IOProxy* bytes = nullptr)
{
    if (std::string const wrong = bytes ? "" : whatIsWrongWithExr(name); !wrong.empty())
        throw damaged(name, wrong);
    // In memory it is taken for what it ought to be.
    auto input = OIIO::ImageInput::open(bytes ? "film.exr" : name, nullptr, bytes);
    if (!input)
        throw InputError(name + ": cannot be read: " + OIIO::geterror());
    return input;
}

} // namespace

StoredFilm readFilm(std::filesystem::path const& file)
{
    return readFilm(file.string(), *opened(file.string()));
}

StoredFilm readFilm(std::string const& name, std::span<unsigned char const> bytes)
{
    OIIO::Filesystem::IOMemReader memory(const_cast<unsigned char*>(bytes.data()), bytes.size());
    return readFilm(name, *opened(name, &memory));
}

FilmHead readFilmHead(std::filesystem::path const& file)
{
    return headOf(file.string(), opened(file.string())->spec());
}

std::string labelText(std::vector<Attachment> const& label, std::string_view name)
{
    for (Attachment const& line : label)
        if (line.name == name)
            return line.text;
    return {};
}

} // namespace zsi::host
