// SPDX-License-Identifier: Apache-2.0
#include "shading/partsOfShade.h"

#include "shading/forwardedServices.h"

#include <cmath>
#include <utility>
#include <vector>

namespace zsi::host {
namespace {

enum Part : unsigned { Environment = 1, Emission = 2, Direct = 4, Indirect = 8 };

float shareOf(float part, float all)
{
    float const share = part / all;
    return std::isfinite(share) ? share : 0.0f;
}

Vec3f shareOf(Vec3f part, Vec3f all)
{
    return {shareOf(part.x, all.x), shareOf(part.y, all.y), shareOf(part.z, all.z)};
}

/// Services that write down what they answer, and answer it again with parts of light left out.
class RecordedServices final : public ForwardedServices {
public:
    explicit RecordedServices(ShadingContext& context)
        : ForwardedServices(context)
        , context_(context)
    {
    }

    /// From now on the same answers with these parts alone, from the first on.
    void replay(unsigned parts)
    {
        replays_ = true;
        parts_ = parts;
        next_ = 0;
    }
    bool hasStraight() const { return hasStraight_; }
    bool hasIndirect() const { return hasIndirect_; }

    LightSample* getLightSamples(int category, Vec3f const* P, Vec3f const* normal) override
    {
        if (!replays_) {
            answers_.push_back({Query::Lights});
            return answers_.back().lights = ForwardedServices::getLightSamples(category, P, normal);
        }
        Answer const answer = again(Query::Lights, {});
        if (!(parts_ & Direct)) // the list stays: what a material draws for each light, it draws
            for (LightSample* l = answer.lights; l; l = l->next)
                l->color = {0, 0, 0};
        return answer.lights;
    }
    Vec3f ambientLight(Vec3f const* P, Vec3f const* N) override
    {
        return scattered(Query::Ambient, [&] { return ForwardedServices::ambientLight(P, N); });
    }
    Vec3f shadowTransmission(Vec3f const* from, Vec3f const* to) override
    {
        return unlit(Query::Shadow, {1, 1, 1},
                     [&] { return ForwardedServices::shadowTransmission(from, to); });
    }
    Vec3f occlusion(Vec3f const* P, Vec3f const* N, float importance) override
    {
        return unlit(Query::Occlusion, {1, 1, 1},
                     [&] { return ForwardedServices::occlusion(P, N, importance); });
    }
    Vec3f indirectDiffuse(Vec3f const* P, Vec3f const* N, float importance) override
    {
        return scattered(Query::Diffuse,
                         [&] { return ForwardedServices::indirectDiffuse(P, N, importance); });
    }
    Vec3f traceReflection(Vec3f const* origin, Vec3f const* direction, float importance) override
    {
        return scattered(Query::Reflection, [&] {
            return ForwardedServices::traceReflection(origin, direction, importance);
        });
    }
    Vec3f traceSpecular(Vec3f const* origin, Vec3f const* direction, float spread,
                        float importance) override
    {
        return scattered(Query::Specular, [&] {
            return ForwardedServices::traceSpecular(origin, direction, spread, importance);
        });
    }
    Vec3f traceRefraction(Vec3f const* origin, Vec3f const* direction, float spread,
                          float importance) override
    {
        return scattered(Query::Refraction, [&] {
            return ForwardedServices::traceRefraction(origin, direction, spread, importance);
        });
    }
    Vec3f traceContinue(int rayType, Vec3f const* origin, Vec3f const* direction,
                        float importance) override
    {
        return rgb(straight(Query::Continue, [&] {
            return withAlpha(
                ForwardedServices::traceContinue(rayType, origin, direction, importance), 1.0f);
        }));
    }
    Vec4f traceThrough(Vec3f const* P, Vec3f const* I, float importance) override
    {
        return straight(Query::Through,
                        [&] { return ForwardedServices::traceThrough(P, I, importance); });
    }
    float random() override
    {
        return unlit(Query::Random, {0.5f, 0, 0},
                     [&] { return Vec3f(ForwardedServices::random(), 0, 0); })
            .x;
    }
    Vec2f random2D() override
    {
        Vec3f const two = unlit(Query::Random2D, {0.5f, 0.5f, 0}, [&] {
            Vec2f const drawn = ForwardedServices::random2D();
            return Vec3f(drawn.x, drawn.y, 0);
        });
        return {two.x, two.y};
    }

private:
    enum class Query {
        Lights,
        Ambient,
        Shadow,
        Occlusion,
        Diffuse,
        Reflection,
        Specular,
        Refraction,
        Continue,
        Through,
        Random,
        Random2D,
    };
    struct Answer {
        Query query;
        LightSample* lights = nullptr;
        Vec4f value{0, 0, 0, 0};
        LightParts shares = {}; ///< of `value`
    };

    /// The next answer of the kind, or `neutral` where less was asked for the first time.
    Answer again(Query query, Vec4f neutral)
    {
        for (std::size_t i = next_; i < answers_.size(); ++i)
            if (answers_[i].query == query) {
                next_ = i + 1;
                return answers_[i];
            }
        return {query, nullptr, neutral};
    }

    /// An answer that is no light.
    template <class Ask>
    Vec3f unlit(Query query, Vec3f neutral, Ask const& ask)
    {
        if (replays_)
            return rgb(again(query, withAlpha(neutral, 1.0f)).value);
        Vec3f const value = ask();
        answers_.push_back({query, nullptr, withAlpha(value, 1.0f)});
        return value;
    }

    /// Light, with what rays on its way have found it to be made of.
    template <class Ask>
    Answer& lit(Query query, Ask const& ask)
    {
        Arrived const before = std::exchange(context_.arrived(), {});
        Vec4f const value = ask();
        Arrived const found = std::exchange(context_.arrived(), before);
        answers_.push_back(
            {query,
             nullptr,
             value,
             {shareOf(found.parts.environment, found.all), shareOf(found.parts.emission, found.all),
              shareOf(found.parts.direct, found.all)}});
        return answers_.back();
    }

    /// Light that the surface sends on: what has come to it straight is direct.
    template <class Ask>
    Vec3f scattered(Query query, Ask const& ask)
    {
        if (!replays_) {
            hasIndirect_ = true;
            return rgb(lit(query, [&] { return withAlpha(ask(), 1.0f); }).value);
        }
        Answer const answer = again(query, {0, 0, 0, 1});
        Vec3f const direct = answer.shares.straight();
        return rgb(answer.value) * chosen(Direct, direct)
            + rgb(answer.value) * chosen(Indirect, Vec3f(1, 1, 1) - direct);
    }

    /// Light that goes on as if the surface were not there.
    template <class Ask>
    Vec4f straight(Query query, Ask const& ask)
    {
        if (!replays_) {
            hasStraight_ = hasIndirect_ = true;
            return lit(query, ask).value;
        }
        Answer const answer = again(query, {0, 0, 0, 0});
        LightParts const& s = answer.shares;
        return withAlpha(rgb(answer.value)
                             * (chosen(Environment, s.environment) + chosen(Emission, s.emission)
                                + chosen(Direct, s.direct)
                                + chosen(Indirect, Vec3f(1, 1, 1) - s.sum())),
                         answer.value.w);
    }

    Vec3f chosen(Part part, Vec3f share) const { return parts_ & part ? share : Vec3f(0, 0, 0); }

    std::vector<Answer> answers_;
    bool replays_ = false, hasStraight_ = false, hasIndirect_ = false;
    unsigned parts_ = 0;
    ShadingContext& context_;
    std::size_t next_ = 0;
};

} // namespace

LightParts shadeInParts(ShadingContext& context, ShadingContext::Call& call)
{
    RecordedServices services(context);
    ShadeState const before = call.state;
    call.material.shader->shade(&services, call.state);
    Vec3f const all = rgb(call.state.Ci);
    if (call.state.discardHit || !isFinite(all))
        return {};
    auto const shown = [&](unsigned parts) {
        services.replay(parts);
        ShadeState state = before;
        call.material.shader->shade(&services, state);
        return state.discardHit || !isFinite(rgb(state.Ci)) ? Vec3f(0, 0, 0) : rgb(state.Ci);
    };
    LightParts parts;
    if (call.ray.depth > 0) {
        if (services.hasStraight())
            parts.emission = all - shown(Direct | Indirect);
        parts.emission += shown(0);
        return parts;
    }
    Vec3f rest = all;
    if (services.hasStraight()) {
        Vec3f const without = shown(Emission | Direct | Indirect);
        parts.environment = rest - without;
        rest = shown(Direct | Indirect);
        parts.emission = without - rest;
    }
    if (services.hasIndirect())
        rest = shown(Direct);
    Vec3f const own = shown(0);
    parts.direct = rest - own;
    parts.emission += own;
    return parts;
}

} // namespace zsi::host
