/// The shared object as a host sees it: its dynamic symbols, and shaders made through them.
#pragma once

#include <cstdint>
#include <dlfcn.h>
#include <elf.h>
#include <fstream>
#include <iterator>
#include <memory>
#include <set>
#include <stdexcept>
#include <string>
#include <vector>
#include <zsi/registration.h>
#include <zsi/zsi.h>

namespace zsi::test {

/// What the dynamic section of an ELF file says.
struct ElfFile {
    std::set<std::string> defined; ///< dynamic symbols that the file offers
    std::set<std::string> needed; ///< libraries that it asks for
    std::size_t initialisers = 0; ///< entries of .init_array
    std::set<std::string> variables; ///< in .data and .bss, but for the compiler's own

    explicit ElfFile(std::string const& path)
    {
        std::ifstream in(path, std::ios::binary);
        std::vector<char> const file{std::istreambuf_iterator<char>(in), {}};
        if (file.size() < sizeof(Elf64_Ehdr))
            throw std::runtime_error("no ELF file: " + path);
        auto const* header = reinterpret_cast<Elf64_Ehdr const*>(file.data());
        auto const* sections = reinterpret_cast<Elf64_Shdr const*>(file.data() + header->e_shoff);
        for (int i = 0; i < header->e_shnum; ++i) {
            Elf64_Shdr const& s = sections[i];
            char const* data = file.data() + s.sh_offset;
            char const* names = file.data() + sections[s.sh_link].sh_offset;
            if (s.sh_type == SHT_INIT_ARRAY)
                initialisers = s.sh_size / sizeof(void*);
            bool const dynamic = s.sh_type == SHT_DYNSYM;
            for (auto const* symbol = reinterpret_cast<Elf64_Sym const*>(data);
                 (dynamic || s.sh_type == SHT_SYMTAB)
                 && reinterpret_cast<char const*>(symbol) < data + s.sh_size;
                 ++symbol) {
                std::string const name = names + symbol->st_name;
                if (symbol->st_shndx == SHN_UNDEF)
                    continue;
                if (dynamic)
                    defined.insert(name);
                if (dynamic || symbol->st_shndx >= header->e_shnum)
                    continue;
                std::string const section = file.data() + sections[header->e_shstrndx].sh_offset
                    + sections[symbol->st_shndx].sh_name;
                bool const variable = section == ".data" || section == ".bss" || section == ".tbss";
                bool const compilers = ELF64_ST_TYPE(symbol->st_info) == STT_SECTION
                    || name.starts_with("__") || name.starts_with("completed.")
                    || name.starts_with("DW.ref.");
                if (variable && !compilers)
                    variables.insert(name);
            }
            for (auto const* entry = reinterpret_cast<Elf64_Dyn const*>(data);
                 s.sh_type == SHT_DYNAMIC
                 && reinterpret_cast<char const*>(entry) < data + s.sh_size;
                 ++entry)
                if (entry->d_tag == DT_NEEDED)
                    needed.insert(names + entry->d_un.d_val);
        }
    }
};

/// The loaded library; stays loaded for the life of the process.
class Library {
public:
    static Library const& instance()
    {
        static Library const library;
        return library;
    }

    std::set<std::string> classes; ///< names before `_create`

    std::unique_ptr<IShaderBase> create(std::string const& name) const
    {
        return std::unique_ptr<IShaderBase>(function<CreateShaderFunction>(name + "_create")());
    }
    int apiVersion(std::string const& name) const
    {
        return function<GetApiVersionFunction>(name + "_getAPIVersion")();
    }
    template <class F>
    F function(std::string const& name) const
    {
        void* const f = dlsym(handle_, name.c_str());
        if (!f)
            throw std::runtime_error("the library has no " + name);
        return reinterpret_cast<F>(f);
    }

private:
    void* handle_ = dlopen(ZSI_SHADER_LIBRARY, RTLD_NOW | RTLD_LOCAL);

    Library()
    {
        if (!handle_)
            throw std::runtime_error(dlerror());
        std::string const suffix = "_create";
        for (std::string const& symbol : ElfFile(ZSI_SHADER_LIBRARY).defined)
            if (symbol.ends_with(suffix))
                classes.insert(symbol.substr(0, symbol.size() - suffix.size()));
    }
};

/// One call of `registerShader`, in order.
struct Registered {
    std::string type; ///< of a parameter, or "attribute"
    std::string name;
    unsigned char* field; ///< null for an attribute
    std::size_t size;
    std::size_t alignment;
    int kind;
    long offset;
};

/// A manager that writes down what a shader registers.
class RecordingManager final : public GenericManager<RecordingManager> {
public:
    std::vector<int> masks;
    std::vector<Registered> rows;
    bool maskFirst = false; ///< `declareEntryPoints` came before every other call
    bool sameShader = true; ///< every call named the same shader

    explicit RecordingManager(IShaderBase& shader)
        : shader_(&shader)
    {
        shader.registerShader(this);
    }

    void declareEntryPoints(IShaderBase* s, int mask) override
    {
        sameShader = sameShader && s == shader_;
        maskFirst = masks.empty() && rows.empty();
        masks.push_back(mask);
    }
    void registerAttribute(IShaderBase* s, int kind, char const* name, long offset) override
    {
        sameShader = sameShader && s == shader_;
        rows.push_back({"attribute", name, nullptr, 0, 0, kind, offset});
    }
    template <class T>
    void parameter(IShaderBase* s, char const* name, T* field)
    {
        sameShader = sameShader && s == shader_;
        rows.push_back({kParameterTypeNames[parameterTypeIndex<T>()], name,
                        reinterpret_cast<unsigned char*>(field), sizeof(T), alignof(T), 0, 0});
    }

private:
    IShaderBase* shader_;
};

/// An entry point: its bit in the mask, the kind of class that has it, and how to call it.
struct EntryPointCall {
    char const* name;
    int bit; ///< 16 would be `specularity`, which no class declares
    int kind;
    void (*call)(IShaderBase const&, IShaderAPI*, ShadeState&);
};
template <class Shader, void (Shader::*entryPoint)(IShaderAPI*, ShadeState&) const>
void callOn(IShaderBase const& shader, IShaderAPI* api, ShadeState& state)
{
    (static_cast<Shader const&>(shader).*entryPoint)(api, state);
}
inline constexpr EntryPointCall kEntryPoints[] = {
    {"shade", 1, 0, callOn<MaterialShader, &MaterialShader::shade>},
    {"transmission", 2, 0, callOn<MaterialShader, &MaterialShader::transmission>},
    {"transfer", 4, 0, callOn<MaterialShader, &MaterialShader::transfer>},
    {"sample", 8, 0, callOn<MaterialShader, &MaterialShader::sample>},
    {"specularity", 16, 0, callOn<MaterialShader, &MaterialShader::specularity>},
    {"illumination", 32, 1, callOn<LightShader, &LightShader::illumination>},
    {"environment shade", 64, 2, callOn<EnvironmentShader, &EnvironmentShader::shade>},
};

} // namespace zsi::test
