// Sound files: 16-bit PCM WAV, mono or stereo, any sample rate.
#ifndef KASTARRI_EXAMPLES_WAV_H
#define KASTARRI_EXAMPLES_WAV_H

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "common/files.h"

namespace examples {

struct Wav {
  unsigned rate = 0;
  unsigned channels = 1;
  std::vector<std::int16_t> samples;  // frame by frame: left, right, left, right, ...

  std::size_t frames() const { return samples.size() / channels; }

  std::vector<std::int16_t> channel(unsigned which) const {
    std::vector<std::int16_t> one(frames());
    for (std::size_t i = 0; i < one.size(); ++i) one[i] = samples[i * channels + which];
    return one;
  }
  void set_channel(unsigned which, const std::vector<std::int16_t>& one) {
    for (std::size_t i = 0; i < one.size(); ++i) samples[i * channels + which] = one[i];
  }
};

namespace wav_detail {

constexpr std::size_t HEADER = 12;  // "RIFF", size, "WAVE"
constexpr std::size_t CHUNK = 8;    // name, size
constexpr unsigned PCM = 1;
constexpr unsigned EXTENSIBLE = 0xfffe;
// What follows the format number in the subformat of an extensible header.
constexpr std::uint8_t SUBFORMAT_REST[14] = {0, 0, 0, 0, 0x10, 0, 0x80, 0, 0, 0xaa, 0, 0x38, 0x9b, 0x71};

inline unsigned u16(const std::uint8_t* p) { return p[0] | static_cast<unsigned>(p[1]) << 8; }
inline std::uint32_t u32(const std::uint8_t* p) { return u16(p) | static_cast<std::uint32_t>(u16(p + 2)) << 16; }
inline bool named(const std::uint8_t* p, const char* name) { return std::memcmp(p, name, 4) == 0; }

inline void read_format(const std::string& name, const std::uint8_t* chunk, std::size_t size, Wav& wav) {
  if (size < 16) throw Failure(name + ": the WAV header is damaged: its format chunk is too short");
  unsigned format = u16(chunk);
  if (format == EXTENSIBLE && size >= 40 && std::memcmp(chunk + 26, SUBFORMAT_REST, sizeof SUBFORMAT_REST) == 0) {
    format = u16(chunk + 24);
  }
  const unsigned bits = u16(chunk + 14);
  wav.channels = u16(chunk + 2);
  wav.rate = u32(chunk + 4);
  if (format != PCM) {
    throw Failure(name + ": compressed or not integer PCM (WAV format " + std::to_string(format) +
                  "); 16-bit PCM is needed");
  }
  if (bits != 16) throw Failure(name + ": " + std::to_string(bits) + " bits a sample; 16-bit PCM is needed");
  if (wav.channels < 1 || wav.channels > 2) {
    throw Failure(name + ": " + std::to_string(wav.channels) + " channels; one or two are needed");
  }
  if (wav.rate == 0 || u16(chunk + 12) != 2 * wav.channels) {
    throw Failure(name + ": the WAV header is damaged: its rate or frame size makes no sense");
  }
}

inline void read_samples(const std::string& name, const std::uint8_t* data, std::size_t size, Wav& wav) {
  if (size % (2 * wav.channels) != 0) throw Failure(name + ": truncated: the last frame is not whole");
  if (size == 0) throw Failure(name + ": holds no sound");
  wav.samples.resize(size / 2);
  for (std::size_t i = 0; i < wav.samples.size(); ++i) wav.samples[i] = static_cast<std::int16_t>(u16(data + 2 * i));
}

}  // namespace wav_detail

// The sound in the bytes of a WAV file; `name` is what messages call it.
inline Wav parse_wav(const Bytes& bytes, const std::string& name) {
  using namespace wav_detail;
  if (bytes.size() < HEADER || !named(bytes.data(), "RIFF") || !named(&bytes[8], "WAVE")) {
    throw Failure(name + ": not a WAV file");
  }
  Wav wav;
  for (std::size_t at = HEADER; bytes.size() - at >= CHUNK;) {
    const std::uint8_t* const chunk = &bytes[at];
    const std::size_t size = u32(chunk + 4);
    at += CHUNK;
    const std::size_t left = bytes.size() - at;
    if (size > left) {
      throw Failure(name + ": truncated: a chunk of " + std::to_string(size) + " bytes has only " +
                    std::to_string(left));
    }
    if (named(chunk, "fmt ")) read_format(name, chunk + CHUNK, size, wav);
    if (named(chunk, "data")) {
      if (wav.rate == 0) throw Failure(name + ": the WAV header is damaged: no format before the data");
      read_samples(name, chunk + CHUNK, size, wav);
      return wav;
    }
    at += std::min(left, size + size % 2);  // chunks start at even places
  }
  throw Failure(name + ": truncated: no sound data in it");
}

inline Wav read_wav(const std::string& path) { return parse_wav(read_file(path), path); }

inline Bytes wav_bytes(const Wav& wav) {
  Bytes bytes;
  bytes.reserve(44 + 2 * wav.samples.size());
  const auto name = [&](const char* four) { bytes.insert(bytes.end(), four, four + 4); };
  const auto number = [&](std::size_t value, int size) {
    for (int i = 0; i < size; ++i) bytes.push_back(static_cast<std::uint8_t>(value >> 8 * i));
  };
  const std::size_t data = 2 * wav.samples.size();
  const std::size_t frame = 2 * wav.channels;
  name("RIFF"), number(36 + data, 4), name("WAVE");
  name("fmt "), number(16, 4), number(wav_detail::PCM, 2), number(wav.channels, 2);
  number(wav.rate, 4), number(wav.rate * frame, 4), number(frame, 2), number(16, 2);
  name("data"), number(data, 4);
  for (const std::int16_t sample : wav.samples) number(static_cast<std::uint16_t>(sample), 2);
  return bytes;
}

// As in "3.33 s, 44100 Hz, stereo".
inline std::string describe(const Wav& wav) {
  char length[32];
  std::snprintf(length, sizeof length, "%.2f s, ", static_cast<double>(wav.frames()) / wav.rate);
  return length + std::to_string(wav.rate) + " Hz, " + (wav.channels == 1 ? "mono" : "stereo");
}

inline void write_wav(const std::string& path, const Wav& wav) { write_file(path, wav_bytes(wav)); }

}  // namespace examples

#endif
