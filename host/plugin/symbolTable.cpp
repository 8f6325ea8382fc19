#include "plugin/symbolTable.h"

#include "base/error.h"

#include <bit>
#include <cstring>
#include <elf.h>
#include <fstream>
#include <optional>
#include <string_view>

namespace zsi::host {

namespace {

/// A file in memory; every read is checked, since offsets in a damaged file point anywhere.
class FileBytes {
public:
    explicit FileBytes(std::vector<char> bytes)
        : bytes_(std::move(bytes))
    {
    }

    template <class T>
    std::optional<T> at(std::uint64_t offset) const
    {
        if (offset > bytes_.size() || bytes_.size() - offset < sizeof(T))
            return std::nullopt;
        T value;
        std::memcpy(&value, bytes_.data() + offset, sizeof value);
        return value;
    }

    /// Zero-terminated text inside [begin, begin + size).
    std::optional<std::string_view> text(std::uint64_t begin, std::uint64_t size,
                                         std::uint64_t offset) const
    {
        if (begin > bytes_.size() || bytes_.size() - begin < size || offset >= size)
            return std::nullopt;
        std::string_view const rest(bytes_.data() + begin + offset, size - offset);
        std::size_t const end = rest.find('\0');
        if (end == std::string_view::npos)
            return std::nullopt;
        return rest.substr(0, end);
    }

private:
    std::vector<char> bytes_;
};

std::vector<char> readFile(std::filesystem::path const& file)
{
    std::error_code failed;
    if (!std::filesystem::is_regular_file(file, failed))
        throw InputError(file.string() + ": no such file");
    std::ifstream in(file, std::ios::binary | std::ios::ate);
    std::vector<char> bytes(in ? static_cast<std::size_t>(in.tellg()) : 0);
    in.seekg(0);
    if (!in.read(bytes.data(), static_cast<std::streamsize>(bytes.size())))
        throw InputError(file.string() + ": cannot be read");
    return bytes;
}

bool isSharedObject(Elf64_Ehdr const& header)
{
    unsigned char const order =
        std::endian::native == std::endian::little ? ELFDATA2LSB : ELFDATA2MSB;
    return std::memcmp(header.e_ident, ELFMAG, SELFMAG) == 0
        && header.e_ident[EI_CLASS] == ELFCLASS64 && header.e_ident[EI_DATA] == order
        && header.e_type == ET_DYN && header.e_shentsize == sizeof(Elf64_Shdr);
}

} // namespace

std::vector<std::string> exportedFunctions(std::filesystem::path const& sharedObject)
{
    FileBytes const file(readFile(sharedObject));
    auto const header = file.at<Elf64_Ehdr>(0);
    if (!header || !isSharedObject(*header))
        throw InputError(sharedObject.string() + ": not a 64-bit shared object");
    auto const section = [&](std::uint64_t index) -> std::optional<Elf64_Shdr> {
        if (index >= header->e_shnum)
            return std::nullopt;
        return file.at<Elf64_Shdr>(header->e_shoff + index * sizeof(Elf64_Shdr));
    };
    std::vector<std::string> names;
    for (std::uint64_t i = 0; i < header->e_shnum; ++i) {
        auto const symbols = section(i);
        if (!symbols)
            throw InputError(sharedObject.string() + ": damaged shared object (section table)");
        if (symbols->sh_type != SHT_DYNSYM)
            continue;
        auto const strings = section(symbols->sh_link);
        if (!strings)
            throw InputError(sharedObject.string() + ": damaged shared object (symbol names)");
        for (std::uint64_t k = 0; k < symbols->sh_size / sizeof(Elf64_Sym); ++k) {
            auto const symbol = file.at<Elf64_Sym>(symbols->sh_offset + k * sizeof(Elf64_Sym));
            if (!symbol)
                throw InputError(sharedObject.string() + ": damaged shared object (symbols)");
            int const type = ELF64_ST_TYPE(symbol->st_info);
            if (symbol->st_shndx == SHN_UNDEF || (type != STT_FUNC && type != STT_GNU_IFUNC))
                continue;
            if (auto const name = file.text(strings->sh_offset, strings->sh_size, symbol->st_name))
                names.emplace_back(*name);
        }
    }
    return names;
}

} // namespace zsi::host
