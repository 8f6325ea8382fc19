// SPDX-License-Identifier: Apache-2.0
#include "film/filmFile.h"

#include "base/error.h"
#include "base/replacedFile.h"

#include <OpenImageIO/filesystem.h>
#include <OpenImageIO/imageio.h>
#include <fmt/format.h>
#include <nlohmann/json.hpp>

namespace zsi::host {
namespace {

using Json = nlohmann::json;
using Words = std::vector<std::uint32_t>;

constexpr char const* kLayers = "zsi:layers";

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

} // namespace

void writeFilm(std::filesystem::path const& file, Film const& film,
               std::vector<Attachment> const& label)
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

    auto const fail = [&](std::string const& why) {
        throw InputError(file.string() + ": cannot be written: " + why);
    };
    ReplacedFile goal(file);
    std::vector<unsigned char> bytes;
    {
        OIIO::Filesystem::IOVecOutput memory(bytes);
        auto const output = OIIO::ImageOutput::create("film.exr");
        if (!output || !output->set_ioproxy(&memory) || !output->open("film.exr", spec))
            fail(output ? output->geterror() : OIIO::geterror());
        Words row;
        for (int y = w.y0; y < w.y1; ++y) {
            row.clear();
            for (int x = w.x0; x < w.x1; ++x) {
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
            if (!output->write_scanline(y, 0, OIIO::TypeDesc::UINT32, row.data()))
                fail(output->geterror());
        }
        if (!output->close())
            fail(output->geterror());
    }
    goal.write(bytes);
    goal.commit();
}

StoredFilm readFilm(std::filesystem::path const& file)
{
    auto const input = OIIO::ImageInput::open(file.string());
    if (!input)
        throw InputError(file.string() + ": cannot be read: " + OIIO::geterror());
    OIIO::ImageSpec const& spec = input->spec();
    auto const damaged = [&](std::string const& why) {
        return InputError(file.string() + ": is no film or a damaged one: " + why);
    };
    if (spec.format != OIIO::TypeDesc::UINT32)
        throw damaged("its values are no integers");
    StoredFilm stored;
    try {
        stored.film = Film(spec.full_width, spec.full_height,
                           {spec.x, spec.y, spec.x + spec.width, spec.y + spec.height},
                           layersOf(spec.get_string_attribute(kLayers)));
    } catch (Json::exception const&) {
        throw damaged("it does not tell its layers");
    }
    for (OIIO::ParamValue const& line : spec.extra_attribs)
        if (line.type() == OIIO::TypeDesc::STRING)
            stored.label.push_back({line.name().string(), line.get_string()});

    Film& film = stored.film;
    Window const& w = film.window();
    auto const first = film.state(w.x0, w.y0);
    std::vector<std::size_t> most(first.ids.size());
    for (std::size_t i = 0; i < most.size(); ++i)
        while (spec.channelindex(fmt::format("ids.{}.{}", i, most[i])) >= 0)
            ++most[i];
    std::vector<std::size_t> at; // of each value among the file's channels
    for (std::string const& name : channelNames(first.sums.size(), first.counts.size(), most)) {
        int const channel = spec.channelindex(name);
        if (channel < 0)
            throw damaged("it lacks " + name);
        at.push_back(static_cast<std::size_t>(channel));
    }
    auto const channels = static_cast<std::size_t>(spec.nchannels);
    Words row(static_cast<std::size_t>(spec.width) * channels);
    for (int y = w.y0; y < w.y1; ++y) {
        if (!input->read_scanline(y, 0, OIIO::TypeDesc::UINT32, row.data()))
            throw damaged(input->geterror());
        for (int x = w.x0; x < w.x1; ++x) {
            std::uint32_t const* const words = &row[static_cast<std::size_t>(x - w.x0) * channels];
            std::size_t next = 0;
            auto const take = [&] { return words[at[next++]]; };
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
    }
    return stored;
}

} // namespace zsi::host
