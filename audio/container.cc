// SPDX-License-Identifier: Apache-2.0
#include "audio/container.h"

#include <algorithm>
#include <cstdint>
#include <iterator>
#include <string_view>

namespace qz::audio {
namespace {

struct Magic {
  const char* name;
  std::string_view bytes;
  size_t offset = 0;
  std::string_view more_bytes = {};  // further on
  size_t more_offset = 0;
};

constexpr Magic kContainers[] = {
    {"WAV", "RIFF", 0, "WAVE", 8},
    {"WAV", "RIFX", 0, "WAVE", 8},
    {"WAV (RF64)", "RF64", 0, "WAVE", 8},
    {"WAV (W64)", "riff\x2E\x91\xCF\x11"},
    {"AIFF", "FORM", 0, "AIFF", 8},
    {"AIFF", "FORM", 0, "AIFC", 8},
    {"SVX", "FORM", 0, "8SVX", 8},
    {"SVX", "FORM", 0, "16SV", 8},
    {"AU", ".snd"},
    {"FLAC", "fLaC"},
    {"Ogg", "OggS"},
    {"CAF", "caff"},
    {"VOC", "Creative Voice"},
    {"NIST", "NIST_1A"},
    // Behind a tag of version 2.2 to 2.4.
    {"MP3", "ID3\x02"},
    {"MP3", "ID3\x03"},
    {"MP3", "ID3\x04"},
};

constexpr Magic kUnreadable[] = {
    {"MPEG-4 audio (m4a, mp4)", "ftyp", 4},
    {"AAC", "ADIF"},
    {"Windows Media audio", "\x30\x26\xB2\x75\x8E\x66\xCF\x11"},
    {"Matroska or WebM", "\x1A\x45\xDF\xA3"},
    {"AMR", "#!AMR"},
    {"WavPack", "wvpk"},
    {"Monkey's Audio", "MAC \x96\x0F"},
};

bool Matches(const std::string& head, const Magic& magic) {
  const std::string_view view = head;
  return view.substr(std::min(magic.offset, view.size()), magic.bytes.size()) == magic.bytes &&
         view.substr(std::min(magic.more_offset, view.size()), magic.more_bytes.size()) ==
             magic.more_bytes;
}

const char* NameOf(const std::string& head, const Magic* begin, const Magic* end) {
  const auto* found =
      std::find_if(begin, end, [&](const Magic& magic) { return Matches(head, magic); });
  return found == end ? nullptr : found->name;
}

}  // namespace

const char* ContainerName(const std::string& head) {
  return NameOf(head, std::begin(kContainers), std::end(kContainers));
}

const char* UnreadableFormatName(const std::string& head) {
  return NameOf(head, std::begin(kUnreadable), std::end(kUnreadable));
}

const char* MpegName(const std::string& head) {
  if (head.size() < 2 || static_cast<uint8_t>(head[0]) != 0xFF) return nullptr;
  const auto second = static_cast<uint8_t>(head[1]);
  const bool layer_0 = (second >> 1 & 3) == 0;  // reserved in MP3's headers, always so in AAC's
  if (layer_0) return second >> 4 == 15 ? "AAC" : nullptr;
  return second >> 5 == 7 && (second >> 3 & 3) != 1 ? "MP3" : nullptr;
}

}  // namespace qz::audio
