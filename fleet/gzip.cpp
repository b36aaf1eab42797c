// Data that may be compressed by gzip.

#include "fleet/gzip.h"

#include <zlib.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <new>

namespace fleet {
namespace {

constexpr unsigned char kMagic[] = {0x1f, 0x8b};
constexpr size_t kBlock = 64 << 10;        // bytes read at once
constexpr int kGzipOnly = MAX_WBITS + 16;  // for zlib: this format and no other

}  // namespace

struct GzipReader::Inflation {
  std::array<unsigned char, kBlock> packed;
  z_stream stream = {};
  bool inMember = true;       // false after the end of a member, where another may begin
  bool damaged = false;       // reported after the bytes before the damage
  bool mayHoldBytes = false;  // the caller's room was full: zlib may hold the rest of a repetition

  Inflation() {
    if (inflateInit2(&stream, kGzipOnly) != Z_OK) throw std::bad_alloc();
  }
  ~Inflation() { inflateEnd(&stream); }
  Inflation(const Inflation &) = delete;
  Inflation &operator=(const Inflation &) = delete;
};

GzipReader::GzipReader(ReadBytes read) : read_(std::move(read)) {}

GzipReader::~GzipReader() = default;

ReadResult GzipReader::Read(char *bytes, size_t room) {
  if (!begun_) return ReadFirst(bytes, room);
  return inflation_ ? Inflate(bytes, room) : read_(bytes, room);
}

ReadResult GzipReader::ReadFirst(char *bytes, size_t room) {
  begun_ = true;
  size_t count = 0;
  // Read at most a block, because packed data is moved to Inflation::packed.
  const size_t most = std::min(room, kBlock);
  while (count < std::min(most, sizeof kMagic)) {
    ReadResult more = read_(bytes + count, most - count);
    if (!more.fault.empty()) return more;
    if (more.count == 0) break;
    count += more.count;
  }
  if (count < sizeof kMagic || std::memcmp(bytes, kMagic, sizeof kMagic) != 0) return {count, ""};
  inflation_ = std::make_unique<Inflation>();
  std::memcpy(inflation_->packed.data(), bytes, count);
  inflation_->stream.next_in = inflation_->packed.data();
  inflation_->stream.avail_in = static_cast<uInt>(count);
  return Inflate(bytes, room);
}

ReadResult GzipReader::Inflate(char *bytes, size_t room) {
  Inflation &inflation = *inflation_;
  z_stream &stream = inflation.stream;
  stream.next_out = reinterpret_cast<unsigned char *>(bytes);
  stream.avail_out = static_cast<uInt>(room);
  while (stream.avail_out == room) {
    if (inflation.damaged) return {0, "the gzip data is damaged"};
    if (stream.avail_in == 0 && !inflation.mayHoldBytes) {
      ReadResult more = read_(reinterpret_cast<char *>(inflation.packed.data()), kBlock);
      if (!more.fault.empty()) return more;
      if (more.count == 0) {
        if (inflation.inMember) more.fault = "the gzip data is cut";
        return more;
      }
      stream.next_in = inflation.packed.data();
      stream.avail_in = static_cast<uInt>(more.count);
    }
    if (!inflation.inMember) {
      // As gzip does, accept zeros after a member: tapes and block devices pad with them.
      while (stream.avail_in > 0 && *stream.next_in == 0) {
        ++stream.next_in;
        --stream.avail_in;
      }
      if (stream.avail_in == 0) continue;
      if (*stream.next_in != kMagic[0]) return {0, "other data follows the gzip data"};
      inflateReset(&stream);
      inflation.inMember = true;
    }
    const int result = inflate(&stream, Z_NO_FLUSH);
    if (result == Z_MEM_ERROR) throw std::bad_alloc();
    if (result == Z_STREAM_END) inflation.inMember = false;
    // Z_BUF_ERROR only says that zlib held no bytes and needs more packed ones.
    inflation.damaged = result != Z_OK && result != Z_STREAM_END && result != Z_BUF_ERROR;
    inflation.mayHoldBytes = inflation.inMember && stream.avail_out == 0;
  }
  return {room - stream.avail_out, ""};
}

}  // namespace fleet
