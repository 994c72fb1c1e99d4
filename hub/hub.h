// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <deque>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "hub/heap.h"
#include "hub/nanoapp_module.h"
#include "hub/runtime/runtime.h"

namespace qz::hub {

// A microphone that the hub offers; its handle is its index in the list of sources.
struct AudioSource {
  std::string name = "microphone";
  uint32_t sample_rate_hz = 16000;
  uint64_t min_buffer_ns = 10'000'000;
  uint64_t max_buffer_ns = 2'000'000'000;
  bool refuses = false;  // answers false to every configuration
  // As the nanoapp last configured it:
  bool enabled = false;
  uint64_t buffer_ns = 0;
  uint64_t interval_ns = 0;
};

// Faults to inject.
struct FaultPlan {
  bool refuse_host_messages = false;
  bool refuse_events = false;
};

// Counts since construction.
struct HubCounts {
  uint64_t audio_buffers = 0;       // delivered to the nanoapp
  uint64_t events = 0;              // delivered to the nanoapp, audio included
  uint64_t client_events = 0;       // from the nanoapp to client nanoapps
  uint64_t messages_to_host = 0;    // from the nanoapp to host endpoints
  uint64_t messages_from_host = 0;  // to the nanoapp
  uint64_t undeliverable = 0;       // to an unknown endpoint or instance, or with no nanoapp
  uint64_t clock_raises = 0;        // requests for the higher processor clock
};

// A context hub on a PC: one nanoapp, one thread, an event queue, a virtual clock. Everything that
// a nanoapp sends is queued and delivered in order; each free callback runs once, after delivery.
// Preconditions named below are checked in every build and end the program.
class Hub final : public Runtime {
 public:
  // `bytes` may be null when `size` is 0; valid during the call.
  using MessageHandler = std::function<void(uint32_t type, const uint8_t* bytes, size_t size)>;
  // `size` is that of the heap block at `data`, 0 when it is none.
  using EventHandler = std::function<void(uint16_t type, const void* data, size_t size)>;
  using LogHandler =
      std::function<void(chreLogLevel level, uint64_t time_ns, const std::string& line)>;

  // Throws std::logic_error if there is a hub already: a process has one at a time.
  explicit Hub(int64_t host_time_offset_ns = 0);
  // Ends the nanoapp if it runs.
  ~Hub() override;

  // Set-up. A log handler runs inside the nanoapp: it must not send or advance the queue.
  void SetLogHandler(LogHandler handler) { log_ = std::move(handler); }
  std::vector<AudioSource>& sources() { return sources_; }
  FaultPlan& fault_plan() { return fault_plan_; }
  Heap& heap() { return heap_; }
  // Lets the virtual clock keep pace with the wall clock.
  void RunInRealTime();

  // Ends the running nanoapp, loads the module and runs its start entry point; false with
  // `*failure` (not null) filled if either fails. Not from a handler.
  bool Start(const std::string& module_path, LoadFailure* failure);
  // The same for a nanoapp that is linked into the program.
  bool StartLinked(const chreNslNanoappInfo& info, LoadFailure* failure);
  // Runs the end entry point, releases what is still queued, and unloads; does nothing if no
  // nanoapp runs. Not from a handler.
  void End();
  // The record of the running nanoapp, or null.
  const chreNslNanoappInfo* nanoapp() const { return nanoapp_; }

  // Host endpoints. Handlers must not be empty; they may send.
  void ConnectHostEndpoint(uint16_t endpoint, MessageHandler handler);
  void DisconnectHostEndpoint(uint16_t endpoint) { endpoints_.erase(endpoint); }
  void SendFromHost(uint16_t endpoint, uint32_t type, const std::vector<uint8_t>& payload);

  // Client nanoapps: adding one returns its instance ID, which must be known to stop it. The
  // nanoapp gets an event when one stops.
  uint32_t AddClientNanoapp(EventHandler handler);
  void StopClientNanoapp(uint32_t instance_id);
  void SendFromClientNanoapp(uint32_t instance_id, uint16_t type);

  // True while a source is enabled.
  bool audio_enabled() const;
  // Advances the time by `count` samples, then delivers them for each enabled source.
  void PlayAudio(const int16_t* samples, uint32_t count);
  // Sends the nanoapp the event that its source was suspended or resumed.
  void SetAudioSuspended(bool suspended);
  void AdvanceTime(uint64_t ns);
  // True while the nanoapp requests the higher processor clock.
  bool clock_raised() const { return clock_raised_; }

  // Delivers any event to the nanoapp at once, then empties the queue.
  void DeliverToNanoapp(uint32_t sender, uint16_t type, const void* data);

  const HubCounts& counts() const { return counts_; }
  // Every fault of the run so far, one message each: misuse of the heap, and after End leaked
  // blocks.
  std::vector<std::string> Faults() const;

  // The runtime's functions.
  void Log(chreLogLevel level, const char* line) override;
  void* HeapAlloc(uint32_t bytes) override { return heap_.Allocate(bytes); }
  void HeapFree(void* block) override { heap_.Free(block); }
  uint64_t TimeNs() override { return now_ns_; }
  int64_t HostTimeOffsetNs() override { return host_time_offset_ns_; }
  bool SendEvent(uint16_t type, void* data, chreEventCompleteFunction* free_callback,
                 uint32_t target_instance_id) override;
  bool SendMessageToHost(void* message, size_t size, uint32_t type, uint16_t endpoint,
                         chreMessageFreeFunction* free_callback) override;
  bool GetAudioSource(uint32_t handle, chreAudioSource* source) override;
  bool ConfigureAudioSource(uint32_t handle, bool enable, uint64_t buffer_duration_ns,
                            uint64_t delivery_interval_ns) override;
  bool RequestClockRate(uint32_t request) override;

 private:
  struct QueuedEvent {
    std::function<void()> deliver;
    std::function<void()> release;  // runs once, delivered or not
  };

  // Queues the event, or releases it at once if it is refused; false then.
  bool Post(bool refused, QueuedEvent queued);
  void RunQueue();
  bool StartNanoapp(const chreNslNanoappInfo& info, const std::string& name, LoadFailure* failure);
  void CallNanoapp(uint32_t sender, uint16_t type, const void* data);
  void PostAudioStatus(uint32_t handle, bool enabled, bool suspended);

  Heap heap_;
  std::unique_ptr<NanoappModule> module_;
  const chreNslNanoappInfo* nanoapp_ = nullptr;
  std::deque<QueuedEvent> queue_;
  std::vector<AudioSource> sources_;
  std::map<uint16_t, MessageHandler> endpoints_;
  std::map<uint32_t, EventHandler> clients_;
  LogHandler log_;
  FaultPlan fault_plan_;
  HubCounts counts_;
  uint64_t now_ns_ = 0;
  int64_t host_time_offset_ns_;
  uint32_t next_instance_id_ = 0x101;
  bool ended_ = false;
  bool in_nanoapp_ = false;  // one of its entry points is running
  bool delivering_ = false;  // a queued event is being delivered
  bool clock_raised_ = false;
  bool real_time_ = false;
  uint64_t wall_start_ns_ = 0;  // wall clock at virtual time 0
};

}  // namespace qz::hub
