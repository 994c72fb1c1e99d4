// SPDX-License-Identifier: Apache-2.0
#include "hub/hub.h"

#include <chrono>
#include <stdexcept>
#include <thread>
#include <utility>

#include "hub/precondition.h"

namespace qz::hub {
namespace {

constexpr uint32_t kSampleRateHz = 16000;
constexpr uint64_t kNsPerSecond = 1'000'000'000;

uint64_t WallClockNs() {
  return static_cast<uint64_t>(std::chrono::duration_cast<std::chrono::nanoseconds>(
                                   std::chrono::steady_clock::now().time_since_epoch())
                                   .count());
}

}  // namespace

Hub::Hub(int64_t host_time_offset_ns) : host_time_offset_ns_(host_time_offset_ns) {
  if (!InstallRuntime(this)) {
    throw std::logic_error("a second hub in one process: the runtime's functions serve one hub");
  }
}

Hub::~Hub() {
  End();
  RemoveRuntime();
}

void Hub::RunInRealTime() {
  real_time_ = true;
  wall_start_ns_ = WallClockNs() - now_ns_;
}

bool Hub::Start(const std::string& module_path, LoadFailure* failure) {
  QZ_HUB_REQUIRE(failure != nullptr);
  End();
  module_ = NanoappModule::Load(module_path, failure);
  if (module_ != nullptr && StartNanoapp(module_->info(), module_path, failure)) return true;
  module_.reset();
  return false;
}

bool Hub::StartLinked(const chreNslNanoappInfo& info, LoadFailure* failure) {
  QZ_HUB_REQUIRE(failure != nullptr);
  End();
  const std::string error = CheckNanoappInfo(info);
  if (error.empty()) return StartNanoapp(info, info.name, failure);
  *failure = {LoadFailure::Kind::kRefused, "linked nanoapp: refused: " + error};
  return false;
}

bool Hub::StartNanoapp(const chreNslNanoappInfo& info, const std::string& name,
                       LoadFailure* failure) {
  QZ_HUB_REQUIRE(!delivering_);
  ended_ = false;
  in_nanoapp_ = true;
  const bool started = info.start();
  in_nanoapp_ = false;
  nanoapp_ = started ? &info : nullptr;
  RunQueue();
  if (nanoapp_ == nullptr) {
    *failure = {LoadFailure::Kind::kRefused, name + ": refused: its start entry point failed"};
  }
  return nanoapp_ != nullptr;
}

void Hub::End() {
  if (nanoapp_ == nullptr) return;
  QZ_HUB_REQUIRE(!delivering_);
  RunQueue();
  in_nanoapp_ = true;
  nanoapp_->end();
  in_nanoapp_ = false;
  // Events queued by the end entry point find no nanoapp, but their free callbacks are in the
  // module.
  nanoapp_ = nullptr;
  RunQueue();
  module_.reset();
  ended_ = true;
}

void Hub::ConnectHostEndpoint(uint16_t endpoint, MessageHandler handler) {
  QZ_HUB_REQUIRE(handler != nullptr);
  endpoints_[endpoint] = std::move(handler);
}

void Hub::SendFromHost(uint16_t endpoint, uint32_t type, const std::vector<uint8_t>& payload) {
  const chreMessageFromHostData message{type, static_cast<uint32_t>(payload.size()),
                                        payload.empty() ? nullptr : payload.data(), endpoint};
  ++counts_.messages_from_host;
  DeliverToNanoapp(0, CHRE_EVENT_MESSAGE_FROM_HOST, &message);
}

uint32_t Hub::AddClientNanoapp(EventHandler handler) {
  QZ_HUB_REQUIRE(handler != nullptr);
  clients_[next_instance_id_] = std::move(handler);
  return next_instance_id_++;
}

void Hub::StopClientNanoapp(uint32_t instance_id) {
  QZ_HUB_REQUIRE(clients_.count(instance_id) == 1);
  clients_.erase(instance_id);
  const chreNanoappInfo info{0, 1, instance_id};
  DeliverToNanoapp(0, CHRE_EVENT_NANOAPP_STOPPED, &info);
}

void Hub::SendFromClientNanoapp(uint32_t instance_id, uint16_t type) {
  DeliverToNanoapp(instance_id, type, nullptr);
}

bool Hub::audio_enabled() const {
  for (const AudioSource& source : sources_) {
    if (source.enabled) return true;
  }
  return false;
}

void Hub::PlayAudio(const int16_t* samples, uint32_t count) {
  QZ_HUB_REQUIRE(samples != nullptr || count == 0);
  const uint64_t start_ns = now_ns_;
  AdvanceTime(count * kNsPerSecond / kSampleRateHz);
  for (uint32_t handle = 0; handle < sources_.size(); ++handle) {
    if (!sources_[handle].enabled) continue;
    chreAudioDataEvent event = {};
    event.version = 1;
    event.handle = handle;
    event.timestamp = start_ns;
    event.sampleRate = kSampleRateHz;
    event.sampleCount = count;
    event.format = CHRE_AUDIO_DATA_FORMAT_16_BIT_SIGNED_PCM;
    event.samplesS16 = samples;
    ++counts_.audio_buffers;
    DeliverToNanoapp(0, CHRE_EVENT_AUDIO_DATA, &event);
  }
}

void Hub::SetAudioSuspended(bool suspended) {
  for (uint32_t handle = 0; handle < sources_.size(); ++handle) {
    if (sources_[handle].enabled) PostAudioStatus(handle, true, suspended);
  }
  RunQueue();
}

void Hub::AdvanceTime(uint64_t ns) {
  now_ns_ += ns;
  if (!real_time_) return;
  const uint64_t wall_ns = WallClockNs() - wall_start_ns_;
  if (wall_ns < now_ns_) std::this_thread::sleep_for(std::chrono::nanoseconds(now_ns_ - wall_ns));
}

void Hub::DeliverToNanoapp(uint32_t sender, uint16_t type, const void* data) {
  RunQueue();
  CallNanoapp(sender, type, data);
  RunQueue();
}

std::vector<std::string> Hub::Faults() const {
  std::vector<std::string> faults = heap_.faults();
  if (ended_ && heap_.live_blocks() > 0) {
    faults.push_back(std::to_string(heap_.live_blocks()) +
                     " heap blocks still held after the end, should be 0");
  }
  return faults;
}

void Hub::Log(chreLogLevel level, const char* line) {
  if (log_) log_(level, now_ns_, line);
}

bool Hub::SendEvent(uint16_t type, void* data, chreEventCompleteFunction* free_callback,
                    uint32_t target_instance_id) {
  auto deliver = [=] {
    const auto client = clients_.find(target_instance_id);
    if (client == clients_.end()) {
      ++counts_.undeliverable;
      return;
    }
    ++counts_.client_events;
    // A copy: the handler may stop its own client.
    const EventHandler handler = client->second;
    handler(type, data, heap_.SizeOf(data));
  };
  auto release = [=] {
    if (free_callback != nullptr) free_callback(type, data);
  };
  return Post(fault_plan_.refuse_events, {deliver, release});
}

bool Hub::SendMessageToHost(void* message, size_t size, uint32_t type, uint16_t endpoint,
                            chreMessageFreeFunction* free_callback) {
  QZ_HUB_REQUIRE(message != nullptr || size == 0);
  auto deliver = [=] {
    const auto host = endpoints_.find(endpoint);
    if (host == endpoints_.end()) {
      ++counts_.undeliverable;
      return;
    }
    ++counts_.messages_to_host;
    const MessageHandler handler = host->second;
    handler(type, static_cast<const uint8_t*>(message), size);
  };
  auto release = [=] {
    if (free_callback != nullptr) free_callback(message, size);
  };
  return Post(fault_plan_.refuse_host_messages, {deliver, release});
}

bool Hub::Post(bool refused, QueuedEvent queued) {
  if (refused) {
    queued.release();
  } else {
    queue_.push_back(std::move(queued));
  }
  return !refused;
}

bool Hub::GetAudioSource(uint32_t handle, chreAudioSource* source) {
  QZ_HUB_REQUIRE(source != nullptr);
  if (handle >= sources_.size()) return false;
  const AudioSource& offered = sources_[handle];
  *source = {offered.name.c_str(), offered.sample_rate_hz, offered.min_buffer_ns,
             offered.max_buffer_ns, CHRE_AUDIO_DATA_FORMAT_16_BIT_SIGNED_PCM};
  return true;
}

bool Hub::ConfigureAudioSource(uint32_t handle, bool enable, uint64_t buffer_duration_ns,
                               uint64_t delivery_interval_ns) {
  if (handle >= sources_.size() || sources_[handle].refuses) return false;
  AudioSource& source = sources_[handle];
  if (enable &&
      (buffer_duration_ns < source.min_buffer_ns || buffer_duration_ns > source.max_buffer_ns)) {
    return false;
  }
  source.enabled = enable;
  source.buffer_ns = buffer_duration_ns;
  source.interval_ns = delivery_interval_ns;
  if (enable) PostAudioStatus(handle, true, false);
  return true;
}

bool Hub::RequestClockRate(uint32_t request) {
  clock_raised_ = request != 0;
  if (clock_raised_) ++counts_.clock_raises;
  return true;
}

void Hub::RunQueue() {
  // One event at a time: a log handler runs inside the nanoapp and must not send.
  QZ_HUB_REQUIRE(!in_nanoapp_);
  while (!queue_.empty()) {
    const QueuedEvent queued = std::move(queue_.front());
    queue_.pop_front();
    const bool outer = std::exchange(delivering_, true);
    queued.deliver();
    queued.release();
    delivering_ = outer;
  }
}

void Hub::CallNanoapp(uint32_t sender, uint16_t type, const void* data) {
  if (nanoapp_ == nullptr) {
    ++counts_.undeliverable;
    return;
  }
  ++counts_.events;
  in_nanoapp_ = true;
  nanoapp_->handleEvent(sender, type, data);
  in_nanoapp_ = false;
}

void Hub::PostAudioStatus(uint32_t handle, bool enabled, bool suspended) {
  auto deliver = [=] {
    const chreAudioSourceStatusEvent event{handle, {enabled, suspended}};
    CallNanoapp(0, CHRE_EVENT_AUDIO_SAMPLING_CHANGE, &event);
  };
  Post(/*refused=*/false, {deliver, [] {}});
}

}  // namespace qz::hub
