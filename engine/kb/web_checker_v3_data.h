// The loaded knowledge of one check factory: every knowledge base of the container, the two
// decision objects and the configuration. The loader fills it once; afterwards it is
// read-only and shared, without locks, by the factory and every checker it made.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "engine/kb/categorized_hosts.h"
#include "engine/kb/engine_config.h"
#include "engine/kb/hosts_pathes_db.h"
#include "engine/kb/lexeme_stats.h"
#include "engine/kb/white_domain_i.h"
#include "engine/kb/words_db.h"

class WebCheckerV3Data {
 public:
  // A decision model: a feature vector in, an output vector out. Implementations are
  // immutable once built, so calc may run on several threads at once.
  class AbstractNetI {
   public:
    virtual void calc(const std::vector<float>& input, std::vector<float>& output) const = 0;
    virtual ~AbstractNetI() = default;
  };

  // What a Solver makes of a model's outputs.
  struct Decision {
    bool detected = false;      // the outputs say phishing
    bool outside_loud = false;  // detected, and farther than threshold_loud from (1, 1)
    float weight = 0.0f;        // the first output (0 when there were fewer than two)
    std::string annotation;     // every output rendered, separated by single blanks
  };

  class Solver {
   public:
    // Decides against the channel's radii `threshold` and `threshold_loud`. Model faults
    // propagate.
    virtual Decision Solve(const std::vector<float>& features,
                           const ap::ChannelConfig& thresholds) const = 0;
    virtual ~Solver() = default;
  };

  // Filled by the loader in this order of fields; the configuration is read last.
  std::shared_ptr<ap::WhiteDomainI> whiteDomains;
  std::shared_ptr<ap::HostsPathesDB> shareLinks;
  std::shared_ptr<ap::CategorizedHostsPathesDB> categorisedHosts;
  lex::WordsDB<char, lex::LexemeStats> lexemes;
  std::shared_ptr<Solver> webSolver;
  std::shared_ptr<Solver> mailSolver;
  ap::EngineConfig config;
};
