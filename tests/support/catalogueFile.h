/// Reads tests/data/catalogue.txt: what each class must tell a host.
#pragma once

#include <cstdint>
#include <cstdlib>
#include <fstream>
#include <map>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

namespace zsi::test {

struct CatalogueRow {
    std::string type; ///< of a parameter, or "attribute"
    std::string name;
    std::vector<unsigned char> value; ///< bytes of the default
    int kind = 0; ///< of an attribute
    long offset = 0; ///< of an attribute
};

struct CatalogueClass {
    int kind = -1;
    int mask = 0;
    bool open = false; ///< parameters after the rows are free
    std::vector<CatalogueRow> rows;
};

class Catalogue {
public:
    std::map<std::string, CatalogueClass> classes;

    explicit Catalogue(std::string const& path)
    {
        std::ifstream file(path);
        std::string line;
        while (std::getline(file, line))
            read(line);
        if (classes.empty())
            throw std::runtime_error("no classes in " + path);
    }

private:
    std::map<std::string, std::vector<CatalogueRow>> blocks_;
    CatalogueClass* class_ = nullptr;
    std::vector<CatalogueRow>* rows_ = nullptr;

    void read(std::string const& line)
    {
        std::istringstream in(line);
        std::string word, name;
        if (!(in >> word) || word[0] == '#')
            return;
        in >> name;
        if (word == "class") {
            static std::map<std::string, int> const kKinds{
                {"material", 0}, {"light", 1}, {"environment", 2}};
            std::string kind;
            class_ = &classes[name];
            in >> kind >> class_->mask;
            class_->kind = kKinds.at(kind);
            rows_ = &class_->rows;
        } else if (word == "block") {
            rows_ = &blocks_[name];
        } else if (word == "use") {
            std::string prefix;
            if (!(in >> prefix))
                in.clear(); // optional
            for (CatalogueRow row : blocks_.at(name)) {
                row.name = prefix + row.name;
                rows_->push_back(row);
            }
        } else if (word == "attribute") {
            CatalogueRow row{word, {}, {}, std::stoi(name), 0};
            in >> row.name >> row.offset;
            rows_->push_back(row);
        } else if (word == "rows") {
            if (rows_->size() != std::stoul(name))
                throw std::runtime_error("not " + name + " rows before: " + line);
        } else if (word == "open") {
            class_->open = true;
            in.clear(); // it has no name
        } else {
            rows_->push_back(parameter(word, name, in));
        }
        if (in.fail())
            throw std::runtime_error("unreadable: " + line);
    }

    static CatalogueRow parameter(std::string const& type, std::string const& name,
                                  std::istringstream& in)
    {
        static std::map<std::string, std::size_t> const kSizes{
            {"bool", 1},       {"int", 4},        {"float", 4},       {"Vec2f", 8},
            {"Vec3f", 12},     {"Vec4f", 16},     {"Mat3f", 36},      {"Mat4f", 64},
            {"texture1D", 16}, {"texture2D", 16}, {"textureCube", 16}};
        CatalogueRow row{type, name, {}, 0, 0};
        std::size_t const size = kSizes.at(type);
        auto const append = [&](auto value) {
            auto const* bytes = reinterpret_cast<unsigned char const*>(&value);
            row.value.insert(row.value.end(), bytes, bytes + sizeof value);
        };
        for (std::string v; in >> v;) {
            if (v == "none") {
                append(std::int64_t{0});
                append(std::int64_t{-1});
            } else if (v == "unset")
                row.value.resize(size);
            else if (type == "bool")
                append(v == "true");
            else if (type == "int")
                append(std::stoi(v));
            else if (v.starts_with("0x"))
                append(static_cast<std::uint32_t>(std::stoul(v, nullptr, 16)));
            else
                append(std::strtof(v.c_str(), nullptr));
        }
        in.clear();
        if (row.value.size() != size)
            throw std::runtime_error("not as many values as it has: " + name);
        return row;
    }
};

} // namespace zsi::test
