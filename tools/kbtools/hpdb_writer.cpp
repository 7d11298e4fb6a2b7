#include "tools/kbtools/hpdb_writer.h"

#include <stdexcept>

#include "engine/kb/categorized_hosts.h"
#include "engine/kb/md5.h"
#include "engine/kb/readable_buffer.h"
#include "tools/kbtools/source_text.h"

namespace pelmix::kbtools {
namespace {

void PutLe(std::string& out, std::uint64_t value, int width) {
  for (int i = 0; i < width; ++i) out += static_cast<char>((value >> (8 * i)) & 0xFF);
}

void Section(std::string& out, std::uint8_t type, std::size_t size) {
  out += static_cast<char>(type);
  PutLe(out, size, 2);
}

}  // namespace

HpdbWriter::Host* HpdbWriter::Find(const std::string& name) {
  for (Host& host : hosts_) {
    if (host.name == name) return &host;
  }
  return nullptr;
}

void HpdbWriter::AddHost(std::string_view host_text, std::uint16_t category,
                         std::optional<std::uint64_t> mask) {
  std::string host = LowerAscii(host_text);
  if (host.empty()) throw std::invalid_argument("empty host");
  if (Find(host) != nullptr) throw std::invalid_argument("host " + host + " is listed twice");
  hosts_.push_back(Host{std::move(host), category, mask, {}});
}

void HpdbWriter::AddPath(std::string_view host_text, std::string_view path_text,
                         std::uint16_t category) {
  const std::string host_name = LowerAscii(host_text);
  Host* host = Find(host_name);
  if (host == nullptr) {
    throw std::invalid_argument("path for host " + host_name + ", which no earlier line names");
  }
  if (path_text.empty()) throw std::invalid_argument("empty path");
  if (path_text.size() > kMaxHpdbPathLength) throw std::invalid_argument("path too long");
  host->paths.push_back(Path{LowerAscii(path_text), category});
}

std::string HpdbWriter::Build() const {
  std::string out;
  for (const Host& host : hosts_) {
    Section(out, hpdb::kHostSection, hpdb::kHostPayloadSize);
    PutLe(out, host.category, 2);
    const ap::Md5Digest digest = ap::Md5Of(host.name);
    out.append(reinterpret_cast<const char*>(digest.data()), digest.size());
    if (host.mask) {
      Section(out, hpdb::kMaskSection, hpdb::kMaskPayloadSize);
      PutLe(out, *host.mask, 8);
    }
    for (const Path& path : host.paths) {
      Section(out, hpdb::kPathSection, hpdb::kPathCategorySize + path.text.size());
      PutLe(out, path.category, 2);
      out += path.text;
    }
  }
  return out;
}

std::string CompileCategorisedHosts(std::string_view text, const std::string& file) {
  struct Check {
    std::size_t line;
    std::string host;
    std::string path;
    std::uint16_t category;
    std::optional<std::uint64_t> mask;  // hosts only
  };
  HpdbWriter writer;
  std::vector<Check> checks;
  for (const SourceLine& line : ReadSourceLines(text)) {
    if (line.fields.size() < 2 || line.fields.size() > 3) {
      throw SourceError(file, line.number, "expected HOST CATEGORY [MASK] or HOST/PATH CATEGORY");
    }
    const auto category = ParseNumber(line.fields[1], 0xFFFF);
    if (!category) {
      throw SourceError(file, line.number,
                        "category must be 0 to 65535, got " + std::string(line.fields[1]));
    }
    const std::string_view target = line.fields[0];
    const std::size_t slash = target.find('/');
    try {
      if (slash == std::string_view::npos) {
        std::optional<std::uint64_t> mask;
        if (line.fields.size() == 3) {
          mask = ParseNumber(line.fields[2], UINT64_MAX, true);
          if (!mask) {
            throw std::invalid_argument("mask must be a 64-bit number, got " +
                                        std::string(line.fields[2]));
          }
        }
        writer.AddHost(target, static_cast<std::uint16_t>(*category), mask);
        checks.push_back(Check{line.number, LowerAscii(target), "",
                               static_cast<std::uint16_t>(*category), mask});
      } else {
        if (line.fields.size() == 3) throw std::invalid_argument("a path line takes no mask");
        const std::string_view host = target.substr(0, slash);
        const std::string_view path = target.substr(slash);
        writer.AddPath(host, path, static_cast<std::uint16_t>(*category));
        checks.push_back(Check{line.number, LowerAscii(host), LowerAscii(path),
                               static_cast<std::uint16_t>(*category), std::nullopt});
      }
    } catch (const std::invalid_argument& e) {
      throw SourceError(file, line.number, e.what());
    }
  }

  std::string bytes = writer.Build();
  if (bytes.size() > UINT32_MAX) throw std::length_error("sb.db would be too large");
  const hpdb::HashedCatHostsPathes reader(
      bytes.empty() ? nullptr
                    : std::make_shared<util::ReadableBuffer>(
                          bytes.data(), static_cast<std::uint32_t>(bytes.size())));
  for (const Check& check : checks) {
    std::uint16_t category = 0;
    std::uint64_t mask = 0;
    bool no_paths = false;
    const bool found = reader.lookup(check.host, check.path, category, mask, no_paths);
    if (!found) throw SourceError(file, check.line, check.host + " would not be found");
    if (check.path.empty() && mask != check.mask.value_or(0)) {
      throw SourceError(file, check.line, check.host + " would not keep its mask");
    }
    if (category != check.category) {
      throw SourceError(
          file, check.line,
          check.host + check.path + " would be found with category " + std::to_string(category) +
              (check.path.empty() ? std::string() : ": an earlier path of its host covers it"));
    }
  }
  return bytes;
}

}  // namespace pelmix::kbtools
