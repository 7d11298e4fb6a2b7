// The external data path: a handler's request reaches the host source, whose sink forwards
// parameters and data to the engine's receiver in order until Close, even across threads.
#include <gtest/gtest.h>

#include <atomic>
#include <mutex>
#include <thread>

#include "framework/uvo/result.h"
#include "host/external_data_source.h"
#include "host/host.h"
#include "services/anti_phishing/heuristic/source/adapters/external_data_handler.h"
#include "services/anti_phishing/heuristic/source/adapters/http_external_sink.h"

namespace cf::services::anti_phishing::heuristic {
namespace {

class RecordingReceiver final : public ap::easy2::ExtDataReceiver {
 public:
  void SetParameter(const std::string& name, const std::string& value) override {
    std::lock_guard<std::mutex> lock(mutex);
    events.push_back("param " + name + "=" + value);
  }
  void AppendData(const char* data, std::size_t length) override {
    if (fail) throw std::runtime_error("receiver refused");
    std::lock_guard<std::mutex> lock(mutex);
    events.push_back("data " + std::string(data, length));
    bytes += length;
  }
  std::mutex mutex;
  std::vector<std::string> events;
  std::atomic<std::size_t> bytes{0};
  bool fail = false;
};

TEST(ExternalData, RequestDeliversInOrderThroughTheHostSource) {
  pelmix::host::Host host;
  auto source = pelmix::host::ExternalDataSource::Create(4);
  source->Add("http://a.example/x", {{{"status", "200"}, {"type", ""}}, "0123456789"});
  ExternalDataHandler handler(host.locator.Get(), source.Get());
  auto receiver = std::make_shared<RecordingReceiver>();
  const std::int32_t before = uvo::detail::ModuleLockCount();
  handler.Request("http://a.example/x", receiver);
  EXPECT_EQ(receiver->events, (std::vector<std::string>{"param status=200", "param type=",
                                                        "data 0123", "data 4567", "data 89"}));
  EXPECT_EQ(uvo::detail::ModuleLockCount(), before);  // the sink is gone with the delivery
  // An unknown URL: the source's failure reaches the caller as an exception.
  EXPECT_THROW(handler.Request("http://b.example/", receiver), uvo::CheckResultFailedException);
  EXPECT_EQ(source->Requests(),
            (std::vector<std::string>{"http://a.example/x", "http://b.example/"}));
  EXPECT_THROW(handler.Request("http://a.example/x", nullptr), uvo::CheckFailedException);
}

TEST(ExternalData, NothingReachesTheReceiverAfterClose) {
  pelmix::host::Host host;
  auto receiver = std::make_shared<RecordingReceiver>();
  auto sink =
      uvo::Ptr<HttpExternalSink>::Adopt(HttpExternalSink::Create(host.locator.Get(), receiver));
  const SessionParam params[] = {{"a", "1"}, {nullptr, nullptr}};
  const SessionParamList list{params, params + 2};
  EXPECT_EQ(sink->SetSessionParams(&list), 0);
  const std::string data = "abc";
  EXPECT_EQ(sink->AppendData({data.data(), data.data() + 3}), 0);
  EXPECT_EQ(sink->Close(), 0);
  EXPECT_EQ(sink->AppendData({data.data(), data.data() + 3}), 0);
  EXPECT_EQ(sink->SetSessionParams(&list), 0);
  EXPECT_EQ(sink->Close(), 0);
  EXPECT_EQ(receiver->events, (std::vector<std::string>{"param a=1", "param =", "data abc"}));
  // The sink no longer holds the receiver.
  EXPECT_EQ(receiver.use_count(), 1);
}

TEST(ExternalData, ReceiverErrorsBecomeResultCodes) {
  pelmix::host::Host host;
  auto receiver = std::make_shared<RecordingReceiver>();
  receiver->fail = true;
  auto sink =
      uvo::Ptr<HttpExternalSink>::Adopt(HttpExternalSink::Create(host.locator.Get(), receiver));
  const std::string data = "abc";
  EXPECT_EQ(sink->AppendData({data.data(), data.data() + 3}), uvo::kErrUnspecified);
  EXPECT_EQ(host.tracer->Texts().back(),
            "cf::services::anti_phishing::heuristic::HttpExternalSink::AppendData: receiver "
            "refused");
  EXPECT_EQ(sink->AppendData({data.data() + 3, data.data()}), uvo::kErrUnexpected);
}

TEST(ExternalData, CloseFromAnotherThreadWhileDataArrives) {
  pelmix::host::Host host;
  for (int round = 0; round < 20; ++round) {
    auto receiver = std::make_shared<RecordingReceiver>();
    std::weak_ptr<RecordingReceiver> watch = receiver;
    auto sink =
        uvo::Ptr<HttpExternalSink>::Adopt(HttpExternalSink::Create(host.locator.Get(), receiver));
    receiver.reset();  // the sink holds the only reference: Close may free it mid-delivery
    std::atomic<bool> closed{false};
    std::atomic<int> failures{0};
    std::thread writer([&] {
      const std::string data = "x";
      while (!closed.load()) {
        if (sink->AppendData({data.data(), data.data() + 1}) != 0) ++failures;
      }
      for (int i = 0; i < 100; ++i) sink->AppendData({data.data(), data.data() + 1});
    });
    std::this_thread::sleep_for(std::chrono::microseconds(200));
    EXPECT_EQ(sink->Close(), 0);
    closed = true;
    writer.join();
    EXPECT_EQ(failures.load(), 0);
    EXPECT_TRUE(watch.expired());  // freed once the last delivery let go of it
  }
}

TEST(ExternalData, DeferredDeliveryOnAnotherThread) {
  pelmix::host::Host host;
  auto source = pelmix::host::ExternalDataSource::Create(2);
  source->Add("u", {{}, "abcde"});
  source->SetDeferred(true);
  ExternalDataHandler handler(host.locator.Get(), source.Get());
  auto receiver = std::make_shared<RecordingReceiver>();
  handler.Request("u", receiver);
  EXPECT_TRUE(receiver->events.empty());
  std::thread([&] { EXPECT_EQ(source->DeliverPending(), 1u); }).join();
  EXPECT_EQ(receiver->events, (std::vector<std::string>{"data ab", "data cd", "data e"}));
  EXPECT_EQ(receiver.use_count(), 1);  // closed after delivery
}

}  // namespace
}  // namespace cf::services::anti_phishing::heuristic
