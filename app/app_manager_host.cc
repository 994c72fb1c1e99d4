// SPDX-License-Identifier: Apache-2.0
// The AppManager's host clients: requests, the map of clients, and what is broadcast to them.

#include <cstring>
#include <utility>

#include "app/app_manager.h"
#include "classifier/types/log_prefix.h"

namespace tarn::contexthub::sound {
namespace {

constexpr uint32_t kQueryResponseBufferSize = 1024;
constexpr uint16_t kInvalidHostEndpoint = 0xFFFF;

// Source position in the out-of-memory log line of a query: fixed, so that a line from the field
// keeps its meaning when the code moves.
constexpr const char* kSourceFile = "app_manager.cc";
constexpr int kQueryOomLine = 174;

void FreeQueryResponse(void* message, size_t /*size*/) { chreHeapFree(message); }
void FreeDetection(void* message, size_t /*size*/) { chreHeapFree(message); }
void FreeRawAudio(void* message, size_t /*size*/) { chreHeapFree(message); }

const uint8_t* Payload(const chreMessageFromHostData& message) {
  return static_cast<const uint8_t*>(message.message);
}

bool SendEmptyResponse(SoundDetectionMessageType type, uint16_t host_endpoint) {
  return chreSendMessageToHostEndpoint(nullptr, 0, type, host_endpoint, nullptr);
}

}  // namespace

void AppManager::HandleMessageFromHost(const chreMessageFromHostData* message) {
  chreLog(CHRE_LOG_INFO,
          "%s Got message from host with type %u size %u data @ %p hostEndpoint 0x%x",
          kApplicationLogPrefix, message->messageType, message->messageSize, message->message,
          message->hostEndpoint);
  switch (message->messageType) {
    case QUERY_REQUEST:
      HandleQueryRequest(message->hostEndpoint);
      break;
    case ENABLE_REQUEST:
      HandleEnableRequest(message);
      break;
    case DISABLE_REQUEST:
      HandleDisableRequest(message);
      break;
    default:
      break;
  }
}

void AppManager::HandleQueryRequest(uint16_t host_endpoint) {
  ChreBuffer buffer = ChreBuffer::Allocate(kQueryResponseBufferSize);
  if (!buffer) {
    chreLog(CHRE_LOG_ERROR, "%s OOM at %s:%d", kApplicationLogPrefix, kSourceFile, kQueryOomLine);
    return;
  }
  uint32_t size = kQueryResponseBufferSize;
  if (!EncodeQueryResponseMessage(buffer.get(), size)) {
    chreLog(CHRE_LOG_ERROR, "%s Failed to encode query response message.", kApplicationLogPrefix);
    return;
  }
  const bool sent = chreSendMessageToHostEndpoint(buffer.release(), size, QUERY_RESPONSE,
                                                  host_endpoint, FreeQueryResponse);
  chreLog(CHRE_LOG_INFO, "%s Result of sending query response: %d", kApplicationLogPrefix, sent);
}

void AppManager::HandleEnableRequest(const chreMessageFromHostData* message) {
  sound_detection_SoundDetectionEnableRequest request = {};
  if (!DecodeSoundDetectionEnableRequestMessage(Payload(*message), message->messageSize,
                                                &request)) {
    return;
  }
  const size_t known = FindHostClient(request.client_id);
  if (known != client_id_host_endpoint_map_.size()) {
    chreLog(CHRE_LOG_INFO, "%s Duplicate enable request received from client ID: %d",
            kApplicationLogPrefix, request.client_id);
    client_id_host_endpoint_map_.erase(known);
  }
  chreLog(CHRE_LOG_INFO, "%s Add host end point: %d", kApplicationLogPrefix, message->hostEndpoint);
  if (!AddClientIdHostEndpointPair(request.client_id, message->hostEndpoint)) {
    chreLog(CHRE_LOG_WARN, "%s Unable to serve new host endpoint %d", kApplicationLogPrefix,
            message->hostEndpoint);
    return;
  }
  if (!is_audio_enabled_) {
    chreLog(CHRE_LOG_INFO, "%s Start", kApplicationLogPrefix);
    RequestAudioData();
  }
  const bool sent = SendEmptyResponse(ENABLE_RESPONSE, message->hostEndpoint);
  chreLog(CHRE_LOG_INFO, "%s Result of sending enable response: %d", kApplicationLogPrefix, sent);
}

void AppManager::HandleDisableRequest(const chreMessageFromHostData* message) {
  sound_detection_SoundDetectionDisableRequest request = {};
  if (!DecodeSoundDetectionDisableRequestMessage(Payload(*message), message->messageSize,
                                                 &request)) {
    return;
  }
  const size_t known = FindHostClient(request.client_id);
  if (known == client_id_host_endpoint_map_.size()) {
    chreLog(CHRE_LOG_WARN, "%s Unregistered client ID for disable request: %d",
            kApplicationLogPrefix, request.client_id);
    return;
  }
  client_id_host_endpoint_map_.erase(known);
  if (ShouldReleaseAudio()) Stop();
  const bool sent = SendEmptyResponse(DISABLE_RESPONSE, message->hostEndpoint);
  chreLog(CHRE_LOG_INFO, "%s Result of sending disable respones: %d", kApplicationLogPrefix, sent);
}

bool AppManager::AddClientIdHostEndpointPair(uint16_t client_id, uint16_t host_endpoint) {
  if (host_endpoint == kInvalidHostEndpoint) {
    chreLog(CHRE_LOG_WARN, "%s Invalid host endpoint: %d", kApplicationLogPrefix, host_endpoint);
    return false;
  }
  if (client_id_host_endpoint_map_.full()) {
    chreLog(CHRE_LOG_WARN, "%s Client id and host endpoint map is full!", kApplicationLogPrefix);
    return false;
  }
  for (const ClientIdHostEndpointPair& pair : client_id_host_endpoint_map_) {
    if (pair.client_id == client_id) {
      chreLog(CHRE_LOG_WARN, "%s Client Id %d is already used.", kApplicationLogPrefix, client_id);
      return false;
    }
    if (pair.host_endpoint == host_endpoint) {
      chreLog(CHRE_LOG_WARN, "%s Host endpoint %d is already used.", kApplicationLogPrefix,
              host_endpoint);
      return false;
    }
  }
  client_id_host_endpoint_map_.push_back({client_id, host_endpoint});
  return true;
}

size_t AppManager::FindHostClient(uint16_t client_id) const {
  size_t index = 0;
  while (index < client_id_host_endpoint_map_.size() &&
         client_id_host_endpoint_map_[index].client_id != client_id) {
    ++index;
  }
  return index;
}

void AppManager::SendSoundDetectionEvent(const ConfidenceEvents& events, uint32_t model_version,
                                         uint64_t timestamp_ns) {
  uint32_t size = 0;
  ChreBuffer message = EncodeDetectionResponseMessage(
      GetDetectionEventResponse(&events, model_version, timestamp_ns),
      /*with_length_prefix=*/false, &size);
  if (!message) {
    chreLog(CHRE_LOG_ERROR, "%s Failed to encode detection response message.",
            kApplicationLogPrefix);
    return;
  }
  SendToHostClients(SOUND_EVENT_DETECTION, std::move(message), size, FreeDetection,
                    "%s Failed to send SOUND_EVENT_DETECTION message to host.");
}

void AppManager::OnRawAudioTransmissibleSegment(uint32_t model_version, uint64_t timestamp_ns,
                                                RawAudioInfo* info) {
  uint32_t size = 0;
  ChreBuffer message =
      EncodeRawAudioSegment(GetRawAudioSegment(model_version, timestamp_ns, info), &size);
  if (!message) {
    chreLog(CHRE_LOG_ERROR, "%s Failed to encode raw audio segment.", kApplicationLogPrefix);
    return;
  }
  SendToHostClients(RAW_AUDIO_SEGMENT, std::move(message), size, FreeRawAudio,
                    "%s Failed to send RAW_AUDIO_SEGMENT message to host client.");
}

void AppManager::SendToHostClients(SoundDetectionMessageType type, ChreBuffer message,
                                   uint32_t size, chreMessageFreeFunction* free_callback,
                                   const char* send_failure) {
  for (const ClientIdHostEndpointPair& pair : client_id_host_endpoint_map_) {
    // The runtime owns what it sends, so every client needs a buffer of its own. No memory for one
    // is logged like a message that could not be sent.
    ChreBuffer copy = ChreBuffer::Allocate(size);
    if (copy) memcpy(copy.get(), message.get(), size);
    if (!copy || !chreSendMessageToHostEndpoint(copy.release(), size, type, pair.host_endpoint,
                                                free_callback)) {
      chreLog(CHRE_LOG_ERROR, send_failure, kApplicationLogPrefix);
    }
  }
}

}  // namespace tarn::contexthub::sound
