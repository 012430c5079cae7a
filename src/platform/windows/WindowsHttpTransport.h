#pragma once

#include "platform/HttpTransport.h"

namespace tarnwick {

class WindowsHttpTransport : public HttpTransport {
 public:
  // Time-outs in milliseconds; tests shorten them.
  explicit WindowsHttpTransport(std::uint32_t connectMs = kConnectTimeoutMs,
                                std::uint32_t silenceMs = kSilenceTimeoutMs)
      : connectMs_(connectMs), silenceMs_(silenceMs) {}

  std::optional<HttpAnswer> Post(const HttpPost& post, std::size_t maxBodyBytes) override;
  std::optional<HttpAnswer> PostStream(const HttpPost& post, BodySource& source,
                                       std::size_t maxBodyBytes) override;
  std::optional<int> Get(const HttpGet& get, std::uint64_t maxBodyBytes, const Sink& sink) override;
  std::int32_t LastFailure() const override { return failure_; }

 private:
  std::uint32_t connectMs_;
  std::uint32_t silenceMs_;
  std::int32_t failure_ = 0;
};

}  // namespace tarnwick
