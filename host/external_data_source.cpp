#include "host/external_data_source.h"

#include <algorithm>

#include "framework/uvo/result.h"

namespace pelmix::host {

using cf::services::anti_phishing::ByteRange;
using cf::services::anti_phishing::IHttpExternalSink;
using cf::services::anti_phishing::SessionParam;
using cf::services::anti_phishing::SessionParamList;

uvo::Ptr<ExternalDataSource> ExternalDataSource::Create(std::size_t pieceSize) {
  return uvo::Ptr<ExternalDataSource>::Adopt(new ExternalDataSource(pieceSize));
}

ExternalDataSource::~ExternalDataSource() {
  for (auto& [sink, url] : pending_) sink->Release();
}

void ExternalDataSource::Add(const std::string& url, Document document) {
  std::lock_guard<std::mutex> lock(mutex_);
  documents_[url] = std::move(document);
}

void ExternalDataSource::SetDeferred(bool deferred) {
  std::lock_guard<std::mutex> lock(mutex_);
  deferred_ = deferred;
}

uvo::result_t ExternalDataSource::Request(const char* url, IHttpExternalSink* sink) {
  if (url == nullptr || sink == nullptr) return uvo::kErrInvalidArgument;
  std::unique_lock<std::mutex> lock(mutex_);
  requests_.emplace_back(url);
  const auto found = documents_.find(url);
  if (found == documents_.end()) return uvo::kErrNotFound;
  if (deferred_) {
    sink->AddRef();
    pending_.emplace_back(sink, url);
    return uvo::kOk;
  }
  const Document document = found->second;
  lock.unlock();
  Deliver(sink, document, pieceSize_);
  return uvo::kOk;
}

std::size_t ExternalDataSource::DeliverPending() {
  std::vector<std::pair<IHttpExternalSink*, std::string>> pending;
  std::map<std::string, Document> documents;
  {
    std::lock_guard<std::mutex> lock(mutex_);
    pending.swap(pending_);
    documents = documents_;
  }
  for (auto& [sink, url] : pending) {
    Deliver(sink, documents[url], pieceSize_);
    sink->Release();
  }
  return pending.size();
}

std::vector<std::string> ExternalDataSource::Requests() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return requests_;
}

void ExternalDataSource::Deliver(IHttpExternalSink* sink, const Document& document,
                                 std::size_t pieceSize) {
  std::vector<SessionParam> params;
  for (const auto& [name, value] : document.params) params.push_back({name.c_str(), value.c_str()});
  const SessionParamList list{params.data(), params.data() + params.size()};
  sink->SetSessionParams(&list);
  const char* data = document.body.data();
  for (std::size_t at = 0; at < document.body.size(); at += pieceSize) {
    const std::size_t n = std::min(pieceSize, document.body.size() - at);
    sink->AppendData(ByteRange{data + at, data + at + n});
  }
  sink->Close();
}

}  // namespace pelmix::host
