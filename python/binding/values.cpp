// SPDX-License-Identifier: Apache-2.0
#include "values.h"

#include "base/error.h"

#include <cmath>
#include <fmt/format.h>
#include <zsi/registration.h>

namespace zsi::python {
namespace {

using host::InputError;
using host::JsonValue;
using Origin = std::shared_ptr<std::filesystem::path const>;

JsonValue converted(py::handle value, Origin const& origin)
{
    JsonValue json;
    json.file = origin;
    if (value.is_none())
        return json;
    if (PyBool_Check(value.ptr())) {
        json.kind = JsonValue::Kind::Bool;
        json.boolean = value.cast<bool>();
    } else if (PyLong_Check(value.ptr())) {
        json.kind = JsonValue::Kind::Integer;
        json.number = value.cast<double>();
    } else if (PyFloat_Check(value.ptr())) {
        json.kind = JsonValue::Kind::Float;
        json.number = value.cast<double>();
        if (!std::isfinite(json.number))
            throw InputError(fmt::format("{}: expected finite numbers", origin->string()));
    } else if (PyUnicode_Check(value.ptr())) {
        json.kind = JsonValue::Kind::String;
        json.text = value.cast<std::string>();
    } else if (py::hasattr(value, "__fspath__")) {
        return converted(value.attr("__fspath__")(), origin);
    } else if (py::hasattr(value, "tolist")) { // numpy's arrays and scalars
        return converted(value.attr("tolist")(), origin);
    } else if (py::hasattr(value, "items")) {
        json.kind = JsonValue::Kind::Object;
        for (py::handle item : value.attr("items")())
            json.members.push_back({py::str(item[py::int_(0)]).cast<std::string>(),
                                    converted(item[py::int_(1)], origin)});
    } else if (PySequence_Check(value.ptr())) {
        json.kind = JsonValue::Kind::Array;
        for (py::handle item : value)
            json.items.push_back(converted(item, origin));
    } else {
        throw InputError(fmt::format(
            "{}: expected numbers, text, a path, a sequence or a mapping, got {}", origin->string(),
            py::str(py::type::handle_of(value).attr("__name__")).cast<std::string>()));
    }
    return json;
}

py::object floats(float const* values, std::vector<py::ssize_t> const& shape)
{
    py::array_t<float> array(shape, values);
    array.attr("setflags")(py::arg("write") = false);
    return array;
}

} // namespace

JsonValue toJson(py::handle value, std::string const& origin)
{
    return converted(value, std::make_shared<std::filesystem::path const>(origin));
}

JsonValue toJson(std::string const& key, JsonValue value)
{
    JsonValue object;
    object.kind = JsonValue::Kind::Object;
    object.file = value.file;
    object.members.push_back({key, std::move(value)});
    return object;
}

py::object toPython(float v) { return py::float_(std::stod(fmt::format("{}", v))); }
py::object toPython(Vec3f v) { return floats(&v.x, {3}); }
py::object toPython(Mat4f const& m) { return floats(m.m, {4, 4}); }

py::object toPython(host::Parameter const& parameter)
{
    using Type = host::ParameterType;
    auto const* const values = static_cast<float const*>(parameter.field);
    switch (parameter.type) {
    case Type::Bool:
        return py::bool_(*static_cast<bool const*>(parameter.field));
    case Type::Int:
        return py::int_(*static_cast<int const*>(parameter.field));
    case Type::Float:
        return toPython(*values);
    case Type::Vec2f:
        return floats(values, {2});
    case Type::Vec3f:
        return floats(values, {3});
    case Type::Vec4f:
        return floats(values, {4});
    case Type::Mat3f:
        return floats(values, {3, 3});
    case Type::Mat4f:
        return floats(values, {4, 4});
    default: // all handles begin with the texture object
        return py::bool_(*static_cast<void* const*>(parameter.field) != nullptr);
    }
}

std::span<Vec3f const> rows3(Floats const& array, char const* name)
{
    bool const single = array.ndim() == 1;
    if ((array.ndim() != 2 && !single) || array.shape(array.ndim() - 1) != 3)
        throw InputError(fmt::format("{}: expected an array of shape (N, 3) or (3,), got {}", name,
                                     py::str(array.attr("shape")).cast<std::string>()));
    return {reinterpret_cast<Vec3f const*>(array.data()),
            single ? 1 : static_cast<std::size_t>(array.shape(0))};
}

} // namespace zsi::python
