// The core property library: call-stack capture for error reports.
//
// Every error carries a call stack, so capturing one must cost microseconds: the frames are
// recorded as return addresses (Boost.Stacktrace's unwinder) and described by what the dynamic
// loader already knows, the module, the offset in it and the nearest exported symbol. No debug
// information is read. A frame's offset is that of the byte before its return address, inside
// the call instruction, so that `addr2line -f -C -e <module> <offset>` names the calling line.
//
// Symbols are looked up only in the shared libraries other than the C and C++ runtime: the loader
// finds a symbol by walking the module's whole table of exported symbols. The runtime libraries
// export thousands, and so does a program built with a sanitizer or linked with its symbols
// exported, while an ordinary program exports none of its functions; frames there are given by
// module and offset, which would otherwise cost more than all the rest of an error.
#include <Tarvek/Core/Interfaces/CallStack.h>

#include <boost/core/demangle.hpp>
#include <boost/stacktrace/frame.hpp>
#include <boost/stacktrace/stacktrace.hpp>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>

#if defined(__has_include)
#if __has_include(<dlfcn.h>) && __has_include(<link.h>)
#include <dlfcn.h>
#include <link.h>
#define TARVEK_CALLSTACK_ELF 1
#endif
#endif

namespace Tarvek {
namespace {

constexpr std::size_t kMostFrames = 64;

void AppendHex(std::string& out, std::uintptr_t value) {
  char text[2 + 2 * sizeof value + 1];
  std::snprintf(text, sizeof text, "0x%llx", static_cast<unsigned long long>(value));
  out += text;
}

#ifdef TARVEK_CALLSTACK_ELF

const char* BaseName(const char* path) {
  const char* const slash = std::strrchr(path, '/');
  return slash == nullptr ? path : slash + 1;
}

// Whether the loader is asked for symbols in a module: not in the program (whose path the loader
// gives as empty) nor in the C or C++ runtime library, known by its file name.
bool LookUpSymbols(const char* path) {
  if (path[0] == '\0') return false;
  const char* const name = BaseName(path);
  for (const char* runtime : {"libc.so", "libstdc++.so", "libc++.so", "libgcc_s.so", "ld-"}) {
    if (std::strncmp(name, runtime, std::strlen(runtime)) == 0) return false;
  }
  return true;
}

// The loaded module holding an address: its file name and load address.
struct Module {
  std::uintptr_t address = 0;
  const char* path = nullptr;
  std::uintptr_t base = 0;
};

int FindModule(dl_phdr_info* info, std::size_t, void* data) {
  auto& module = *static_cast<Module*>(data);
  for (ElfW(Half) i = 0; i < info->dlpi_phnum; ++i) {
    const ElfW(Phdr)& segment = info->dlpi_phdr[i];
    if (segment.p_type != PT_LOAD) continue;
    const std::uintptr_t start = info->dlpi_addr + segment.p_vaddr;
    if (module.address >= start && module.address - start < segment.p_memsz) {
      module.path = info->dlpi_name;
      module.base = info->dlpi_addr;
      return 1;
    }
  }
  return 0;
}

// One frame: "Symbol+0x2a in libmodule.so.0+0x1f3a", "?? in module+0x1f3a" where the symbol is
// not exported or not looked up, or the plain address where no module holds it.
void AppendFrame(std::string& out, const boost::stacktrace::frame& frame) {
  const auto address = reinterpret_cast<std::uintptr_t>(frame.address());
  Module module;
  module.address = address - 1;
  if (address == 0 || dl_iterate_phdr(FindModule, &module) == 0) {
    AppendHex(out, address);
    return;
  }
  const char* const path = module.path;
  Dl_info info{};
  if (LookUpSymbols(path) && dladdr(reinterpret_cast<void*>(module.address), &info) != 0 &&
      info.dli_sname != nullptr) {
    out += boost::core::demangle(info.dli_sname);
    out += '+';
    AppendHex(out, module.address - reinterpret_cast<std::uintptr_t>(info.dli_saddr));
  } else {
    out += "??";
  }
  out += " in ";
  out += path[0] == '\0' ? "<program>" : BaseName(path);
  out += '+';
  AppendHex(out, module.address - module.base);
}

#else

void AppendFrame(std::string& out, const boost::stacktrace::frame& frame) {
  out += boost::stacktrace::to_string(frame);
}

#endif

}  // namespace

std::string GetCallStack() {
  // Skip this function's own frame; the caller is the first frame a reader cares about.
  const boost::stacktrace::stacktrace frames(1, kMostFrames);
  std::string text;
  text.reserve(96 * frames.size());
  char number[32];
  for (std::size_t i = 0; i < frames.size(); ++i) {
    std::snprintf(number, sizeof number, "%2zu# ", i);
    text += number;
    AppendFrame(text, frames[i]);
    text += '\n';
  }
  return text;
}

}  // namespace Tarvek
