// Everything of the operating system that the core uses, behind the seam.
#pragma once

namespace tarnwick {

class FileSystem;
class HttpTransport;
class Internet;
class Registry;
class StringResources;

// The thread's message queue.
class MessagePump {
 public:
  virtual ~MessagePump() = default;

  // Handles the messages that wait now and returns; a quit message is put back.
  virtual void Yield() = 0;

  // Sleeps, without using the processor, until there is a message, then does the same as Yield. False when
  // there is a quit message: whoever waits has to stop, because the sleep would end at once each time.
  virtual bool Wait() = 0;
};

// The implementations outlive whatever is handed this.
struct Platform {
  Registry& registry;
  HttpTransport& http;
  Internet& internet;
  FileSystem& files;
  StringResources& strings;
  MessagePump& pump;
};

}  // namespace tarnwick
