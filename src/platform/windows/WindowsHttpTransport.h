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

 private:
  std::uint32_t connectMs_;
  std::uint32_t silenceMs_;
};

}  // namespace tarnwick
