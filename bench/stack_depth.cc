// SPDX-License-Identifier: Apache-2.0
// Measures what the module's entry points use of the stack: every call runs on a stack of its own
// that was filled with a pattern before; the deepest byte that changed is how far it went. Prints a
// line for each kind of call: its name, a tab, the most bytes that one of them used.
// scripts/footprint runs it under emulation.
//
// What is measured holds for the calls made here: the deepest that the module's design allows,
// every class detected for as many host clients as there can be, and requests that fail to decode.

#include <ucontext.h>

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <string>
#include <vector>

#include "app/nanoapp.h"
#include "app/sound_service.h"
#include "bench/minimal_runtime.h"
#include "chre.h"
#include "classifier/detection_tables.h"
#include "config/detector.h"
#include "proto/sound_detection_message_type.h"
#include "tests/support/random.h"

namespace tarn::contexthub::sound {

// Every class in every pass.
const float kSoundThresholds[kSoundCategoryCount] = {-1, -1, -1, -1, -1};
const uint64_t kSoundDetectionCoolingTimeNs[kSoundCategoryCount] = {};

}  // namespace tarn::contexthub::sound

namespace {

namespace sound = tarn::contexthub::sound;

constexpr unsigned kHostClients = 8;
constexpr unsigned kNanoapps = 3;
constexpr unsigned kPasses = 3;  // the network runs from the second on

using Handler = void (*)(uint32_t sender, uint16_t type, const void* data);

struct Call {
  Handler handler;
  uint32_t sender;
  uint16_t type;
  const void* data;
};

constexpr unsigned char kPattern = 0xA5;
std::array<unsigned char, size_t{64} * 1024> stack;
Call call;
ucontext_t here;
size_t touched;

// Looks at the stack before it returns: switching back changes more of it.
void RunCall() {
  call.handler(call.sender, call.type, call.data);
  size_t untouched = 0;
  while (untouched < stack.size() && stack[untouched] == kPattern) ++untouched;
  touched = stack.size() - untouched;
}

void Nothing(uint32_t, uint16_t, const void*) {}
void Start(uint32_t, uint16_t, const void*) { nanoappStart(); }
void End(uint32_t, uint16_t, const void*) { nanoappEnd(); }

// Bytes of the stack that the call and what starts it changed; the whole stack when it was too
// small.
size_t BytesTouched(const Call& made) {
  stack.fill(kPattern);
  call = made;
  ucontext_t there;
  getcontext(&there);
  there.uc_stack.ss_sp = stack.data();
  there.uc_stack.ss_size = stack.size();
  there.uc_link = &here;
  makecontext(&there, RunCall, 0);
  swapcontext(&here, &there);
  return touched;
}

// Makes the calls, in their order, and prints the most that one of them used.
void Measure(const std::string& name, const std::vector<Call>& calls) {
  static const size_t kOfTheStart = BytesTouched({Nothing, 0, 0, nullptr});
  size_t most = 0;
  for (const Call& each : calls) most = std::max(most, BytesTouched(each));
  std::printf("%s\t%zu\n", name.c_str(), most - kOfTheStart);
}

void MeasureEvents(const std::string& name, const std::vector<Call>& calls) {
  Measure("nanoappHandleEvent: " + name, calls);
}

// Messages of one type, one from each endpoint; they stay where they are.
class Messages {
 public:
  Messages(uint32_t type, const std::vector<std::string>& payloads) : payloads_(payloads) {
    for (size_t i = 0; i < payloads_.size(); ++i) {
      data_.push_back({type, static_cast<uint32_t>(payloads_[i].size()), payloads_[i].data(),
                       static_cast<uint16_t>(i + 1)});
    }
  }

  std::vector<Call> Calls() const {
    std::vector<Call> calls;
    for (const chreMessageFromHostData& each : data_) {
      calls.push_back({nanoappHandleEvent, 0, CHRE_EVENT_MESSAGE_FROM_HOST, &each});
    }
    return calls;
  }

 private:
  std::vector<std::string> payloads_;
  std::vector<chreMessageFromHostData> data_;
};

// A request that enables or disables a host client: its ID is field 2 or 1.
std::vector<std::string> Requests(int client_id_field) {
  std::vector<std::string> requests;
  for (unsigned id = 0; id < kHostClients; ++id) {
    requests.push_back({static_cast<char>(client_id_field << 3), static_cast<char>(id)});
  }
  return requests;
}

// Requests that exercise the decoder: fields of every wire type that it must skip, lists packed and
// not, a client ID that is too great, a tag of zero, and every one cut short.
std::vector<std::string> UnusualRequests() {
  using namespace std::string_literals;
  const std::string whole =
      "\x0a\x03\x01\x02\x03"                          // categories, packed
      "\x08\x01"                                      // a category
      "\x18\x80\x80\x80\x80\x80\x80\x80\x80\x80\x01"  // unknown: the longest number
      "\x21\1\2\3\4\5\6\7\x08"                        // unknown: 8 bytes
      "\x2d\1\2\3\4"                                  // unknown: 4 bytes
      "\x32\x02\1\2"                                  // unknown: a string
      "\x10\xff\xff\xff\xff\x0f"s;                    // a client ID that is too great
  std::vector<std::string> requests;
  for (size_t length = 0; length <= whole.size(); ++length) {
    requests.push_back(whole.substr(0, length));
  }
  requests.push_back("\0\0"s);
  requests.push_back("\x1b\x08\x01\x1c"s);  // a group
  return requests;
}

std::vector<Call> FromNanoapps(uint16_t event) {
  std::vector<Call> calls;
  for (unsigned i = 0; i < kNanoapps; ++i) calls.push_back({nanoappHandleEvent, i, event, nullptr});
  return calls;
}

void MeasureAudio() {
  constexpr uint32_t kSamples = qz::config::kBufferSamples;
  const auto samples = qz::test::Random(1).Fill<int16_t>(kSamples, -32768, 32767);
  chreAudioDataEvent data = {};
  data.sampleCount = kSamples;
  data.samplesS16 = samples.data();
  MeasureEvents("audio, " + std::to_string(sound::kSoundCategoryCount) + " detections to " +
                    std::to_string(kHostClients) + " host clients",
                std::vector<Call>(kPasses, {nanoappHandleEvent, 0, CHRE_EVENT_AUDIO_DATA, &data}));
}

}  // namespace

int main() {
  const Messages query(sound::QUERY_REQUEST, {""});
  const Messages enable(sound::ENABLE_REQUEST, Requests(2));
  const Messages disable(sound::DISABLE_REQUEST, Requests(1));
  const Messages unusual_enable(sound::ENABLE_REQUEST, UnusualRequests());
  const Messages unusual_disable(sound::DISABLE_REQUEST, UnusualRequests());

  Measure("nanoappStart", {{Start, 0, 0, nullptr}});
  MeasureEvents("query", query.Calls());
  MeasureEvents("unusual enable requests", unusual_enable.Calls());
  MeasureEvents("unusual disable requests", unusual_disable.Calls());
  MeasureEvents("disable request", disable.Calls());
  MeasureEvents("enable request", enable.Calls());
  MeasureEvents("client nanoapp registers", FromNanoapps(sound::kSoundServiceRegisterEvent));
  qz::bench::sent = {};
  MeasureAudio();
  if (qz::bench::sent.messages != kPasses * kHostClients ||
      qz::bench::sent.events != kPasses * kNanoapps) {
    std::fprintf(stderr, "stack_depth: %u messages and %u reports, expected %u and %u\n",
                 qz::bench::sent.messages, qz::bench::sent.events, kPasses * kHostClients,
                 kPasses * kNanoapps);
    return 1;
  }
  MeasureEvents("client nanoapp unregisters", FromNanoapps(sound::kSoundServiceUnregisterEvent));
  MeasureEvents("last host client disabled", disable.Calls());
  for (const Call& each : enable.Calls()) BytesTouched(each);  // so that audio is on
  Measure("nanoappEnd", {{End, 0, 0, nullptr}});
  return 0;
}
