// The reference host's external data source: answers a session's requests for extra page
// data from documents registered in memory. It delivers at once (parameters, the body in
// pieces, Close), or, when deferred, keeps the sinks until DeliverPending is called, which
// may be on another thread.
#pragma once

#include <cstddef>
#include <map>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include "framework/uvo/anti_phishing.h"
#include "framework/uvo/object.h"

namespace pelmix::host {

class ExternalDataSource final
    : public uvo::ObjectImpl<ExternalDataSource,
                             cf::services::anti_phishing::IHttpExternalDataSource> {
 public:
  struct Document {
    std::vector<std::pair<std::string, std::string>> params;
    std::string body;
  };

  static uvo::Ptr<ExternalDataSource> Create(std::size_t pieceSize = 4096);
  explicit ExternalDataSource(std::size_t pieceSize) : pieceSize_(pieceSize ? pieceSize : 1) {}
  ~ExternalDataSource();

  void Add(const std::string& url, Document document);
  void SetDeferred(bool deferred);

  // Slot 3. An unknown URL answers 0x8000004C ("Not found") and keeps nothing.
  uvo::result_t Request(const char* url,
                        cf::services::anti_phishing::IHttpExternalSink* sink) override;

  // Delivers every kept request; returns how many.
  std::size_t DeliverPending();
  std::vector<std::string> Requests() const;

 private:
  static void Deliver(cf::services::anti_phishing::IHttpExternalSink* sink,
                      const Document& document, std::size_t pieceSize);

  const std::size_t pieceSize_;
  mutable std::mutex mutex_;
  bool deferred_ = false;
  std::map<std::string, Document> documents_;
  std::vector<std::string> requests_;
  std::vector<std::pair<cf::services::anti_phishing::IHttpExternalSink*, std::string>> pending_;
};

}  // namespace pelmix::host
