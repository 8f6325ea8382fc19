// SPDX-License-Identifier: Apache-2.0
#include "plugin/symbolTable.h"

#include "base/error.h"

#include <fcntl.h>
#include <fmt/format.h>
#include <gelf.h>
#include <unistd.h>

namespace zsi::host {

namespace {

/// An ELF file, mapped as far as it is read. Offsets in a damaged one may point anywhere; libelf
/// checks them.
class ElfFile {
public:
    explicit ElfFile(std::filesystem::path const& file)
        : descriptor_(open(file.c_str(), O_RDONLY | O_CLOEXEC))
    {
        elf_version(EV_CURRENT);
        if (descriptor_ >= 0)
            elf_ = elf_begin(descriptor_, ELF_C_READ, nullptr);
    }
    ~ElfFile()
    {
        elf_end(elf_);
        if (descriptor_ >= 0)
            close(descriptor_);
    }
    ElfFile(ElfFile const&) = delete;
    ElfFile& operator=(ElfFile const&) = delete;

    bool isOpen() const { return descriptor_ >= 0; }
    Elf* get() const { return elf_; }
    /// False where this is no ELF file.
    bool read(GElf_Ehdr& header) const { return elf_ && gelf_getehdr(elf_, &header) != nullptr; }

private:
    int descriptor_;
    Elf* elf_ = nullptr;
};

/// Whether the file is a shared object for the machine that this program runs on.
bool isLoadable(ElfFile const& file)
{
    GElf_Ehdr header, own;
    if (!file.read(header) || !ElfFile("/proc/self/exe").read(own))
        return false;
    return header.e_type == ET_DYN && header.e_machine == own.e_machine
        && header.e_ident[EI_CLASS] == own.e_ident[EI_CLASS]
        && header.e_ident[EI_DATA] == own.e_ident[EI_DATA];
}

} // namespace

std::vector<std::string> exportedFunctions(std::filesystem::path const& sharedObject)
{
    std::error_code failed;
    if (!std::filesystem::is_regular_file(sharedObject, failed))
        throw InputError(sharedObject.string() + ": no such file");
    ElfFile const file(sharedObject);
    if (!file.isOpen())
        throw InputError(sharedObject.string() + ": cannot be read");
    if (!isLoadable(file))
        throw InputError(sharedObject.string() + ": not a shared object for this machine");
    auto const damaged = [&](char const* where) {
        throw InputError(
            fmt::format("{}: damaged shared object ({})", sharedObject.string(), where));
    };
    std::vector<std::string> names;
    GElf_Shdr header{};
    Elf_Scn* section = nullptr;
    while (header.sh_type != SHT_DYNSYM) {
        section = elf_nextscn(file.get(), section);
        if (!section || !gelf_getshdr(section, &header)) // a file cut short has lost its sections
            damaged("no table of dynamic symbols");
    }
    Elf_Data* const symbols = elf_getdata(section, nullptr);
    if (!symbols)
        damaged("dynamic symbols");
    GElf_Sym symbol;
    for (int i = 0; gelf_getsym(symbols, i, &symbol); ++i) {
        int const type = GELF_ST_TYPE(symbol.st_info);
        if (symbol.st_shndx == SHN_UNDEF || (type != STT_FUNC && type != STT_GNU_IFUNC))
            continue;
        char const* const name = elf_strptr(file.get(), header.sh_link, symbol.st_name);
        if (!name)
            damaged("symbol names");
        names.emplace_back(name);
    }
    return names;
}

} // namespace zsi::host
