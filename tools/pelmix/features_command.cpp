// pelmix features: a page (or a mail text part) through the decrunch pipeline into the
// feature extractor, on a knowledge base's lexemes and domains, and the vector it makes.
#include <filesystem>
#include <iostream>
#include <memory>
#include <sstream>

#include "engine/checkers/cached_white_domains.h"
#include "engine/features/feature_layout.h"
#include "engine/features/html_features.h"
#include "engine/html/decrunch.h"
#include "engine/kb/kb_loader.h"
#include "host/stream.h"
#include "internal/helpers/io_adapters/antiphishing_io_adapter.h"
#include "tools/pelmix/chunked_input.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/json_lines.h"
#include "tools/pelmix/kb_container.h"
#include "tools/pelmix/module_host.h"

namespace pelmix::cli {
namespace {

// The mail checker's link block as it gathers it: the dangerous-attachment value, the first
// body links' vectors.
struct MailLinks final : ap::HTMLFeatures::TagAFeaturesI {
  std::vector<float> block{0.0f};
  int bodyLinks = 0;
  bool operator()(const std::vector<float>& values) override {
    ++bodyLinks;
    block.insert(block.end(), values.begin(), values.end());
    return bodyLinks < 2;
  }
};

std::string Number(float v) {
  std::ostringstream out;
  out << v;
  return out.str();
}

int RunFeatures(const std::vector<std::string>& args, const GlobalOptions&) {
  std::string kbPath = DefaultKnowledgeBase();
  std::string url;
  bool mail = false, names = false;
  std::vector<std::string> rest;
  for (std::size_t i = 0; i < args.size(); ++i) {
    if (args[i] == "--kb" || args[i] == "--url") {
      if (i + 1 >= args.size()) return UsageError("features: " + args[i] + " needs a value");
      (args[i] == "--kb" ? kbPath : url) = args[i + 1];
      ++i;
    } else if (args[i] == "--mail") {
      mail = true;
    } else if (args[i] == "--names") {
      names = true;
    } else {
      rest.push_back(args[i]);
    }
  }
  if (mail && !url.empty()) return UsageError("features: --url and --mail exclude each other");
  ChunkedInputOptions input;
  std::vector<std::string> unknown;
  std::string error;
  if (!ParseChunkedInput(rest, &input, &unknown, &error)) return UsageError("features: " + error);
  if (!unknown.empty()) return UsageError("features: unexpected argument " + unknown.front());

  WebCheckerV3Data knowledge;
  try {
    uvo::Ptr<host::FileStream> file = host::FileStream::Open(kbPath, &error);
    if (!file) throw KbFileError(error);
    loaders_misc::load(knowledge,
                       std::make_shared<cf::adapters::AntiphishingIOAdapter>(file.Get()));
  } catch (const std::exception& e) {
    std::cerr << "pelmix features: cannot load " << kbPath << ": " << DescribeFailure(e) << "\n";
    return kExitModule;
  }
  // Web pages ask about share links and categorised hosts too; mail only about domains.
  easy3_impl::CachedWhiteDomains lookup(*knowledge.whiteDomains,
                                        mail ? nullptr : knowledge.shareLinks,
                                        mail ? nullptr : knowledge.categorisedHosts);
  MailLinks links;
  ap::HTMLFeatures features(url, lookup, knowledge.lexemes, mail ? &links : nullptr);

  std::unique_ptr<html::Decrunch> pipeline;
  bool sniffed = !mail;  // a mail part is HTML when its first byte above blank is '<'
  std::uint32_t bytes = 0;
  if (!mail) pipeline = std::make_unique<html::Decrunch>(features, false);
  const bool ok = ReadChunks(
      input,
      [&](std::string_view chunk) {
        if (!sniffed) {
          const auto first = chunk.find_first_not_of(
              std::string_view("\x01\x02\x03\x04\x05\x06\x07\x08\x09\x0a\x0b\x0c\x0d\x0e\x0f\x10"
                               "\x11\x12\x13\x14\x15\x16\x17\x18\x19\x1a\x1b\x1c\x1d\x1e\x1f\x20",
                               32));
          if (first == std::string_view::npos) {
            bytes = html::addByteCount(bytes, chunk.size());
            return;
          }
          sniffed = true;
          if (chunk[first] == '<') pipeline = std::make_unique<html::Decrunch>(features, false);
        }
        bytes = html::addByteCount(bytes, chunk.size());
        if (pipeline) {
          pipeline->feed(chunk.data(), chunk.size());
        } else {
          features.text(chunk.data(), chunk.size());
        }
      },
      &error);
  if (!ok) {
    std::cerr << "pelmix features: " << error << "\n";
    return kExitFailure;
  }
  pipeline.reset();

  std::string target;
  std::vector<float> vector;
  features.GetVector(target, vector, bytes);
  if (mail) {
    links.block.resize(html_features::kMailLinkBlockSize, 0.0f);
    vector.insert(vector.end(), links.block.begin(), links.block.end());
  }
  if (names) {
    for (std::size_t i = 0; i < vector.size(); ++i)
      std::cout << i << '\t' << html_features::FeatureName(i, mail) << '\t' << Number(vector[i])
                << '\n';
    return kExitOk;
  }
  JsonLine line;
  line.Bytes("target", target).Bool("trusted", features.trusted());
  std::string values = "[";
  for (std::size_t i = 0; i < vector.size(); ++i) values += (i ? "," : "") + Number(vector[i]);
  line.Raw("vector", values + "]");
  line.Write(std::cout);
  return kExitOk;
}

}  // namespace

PELMIX_COMMAND({"features", "[--kb FILE] [--url URL | --mail] [--chunk N] [--names] FILE|-",
                "print the feature vector and target of a page (or, with --mail, a mail text "
                "part)",
                RunFeatures})

}  // namespace pelmix::cli
