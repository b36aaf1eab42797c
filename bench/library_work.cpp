// Does the library's part of the command's work, alone in a process, to time the command against.
//   library_work make FOLDER         makes the inputs: kvr.bin of 15 MB, snapshot.bin of 100 MB
//   library_work fleet FOLDER COUNT  makes COUNT full KVR dumps of 22 KB, in folders of 100
//   library_work stats FILE          parses and prints a line for each entry
//   library_work snapshot FILE       renders in one call and prints the text

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>

#include "bench/streams.h"
#include "morwick/morwick.h"

namespace {

std::string ReadAll(const std::string &file) {
  std::ifstream stream(file, std::ios::binary | std::ios::ate);
  std::string bytes(static_cast<size_t>(stream.tellg()), '\0');
  stream.seekg(0);
  stream.read(bytes.data(), static_cast<std::streamsize>(bytes.size()));
  return bytes;
}

void Make(const std::string &folder) {
  bench::Stream stream = bench::StatsStream(1);
  const std::string once = stream.buffer;
  while (stream.buffer.size() + once.size() <= 15000000) stream.buffer += once;
  std::ofstream(folder + "/kvr.bin", std::ios::binary) << stream.buffer;

  std::mt19937_64 random(1);
  std::string snapshot;
  while (snapshot.size() < 100000000) {
    for (size_t word = 0; word < sizeof(SnapshotRecord) / 4; ++word) {
      bench::Append(&snapshot, static_cast<uint32_t>(bench::MixedMagnitude(random, 32)));
    }
  }
  std::ofstream(folder + "/snapshot.bin", std::ios::binary) << snapshot;
}

// Every dump has all keys, with values of its own: counters of up to 31 bits, as most are.
void MakeFleet(const std::string &folder, int count) {
  std::mt19937_64 random(1);
  for (int i = 0; i < count; ++i) {
    const auto dump = bench::MakeStream<uint32_t, uint64_t>(kMorwickKVR, 1, 1, random, 31).buffer;
    const std::string machine = folder + "/" + std::to_string(i / 100);
    std::filesystem::create_directories(machine);
    std::ofstream(machine + "/" + std::to_string(i % 100) + ".bin", std::ios::binary) << dump;
  }
}

void Stats(const std::string &file) {
  const std::string bytes = ReadAll(file);
  KVRStatsCxt context = {};
  if (KVRParseBufferToCxt(&context, bytes.data(), static_cast<uint32_t>(bytes.size())) != 1) {
    std::abort();
  }
  const ContextNode *value = context.valuesHead;
  for (const ContextNode *name = context.namesHead; name != nullptr; name = name->next) {
    fputs_unlocked(name->text, stdout);
    fputs_unlocked(" : ", stdout);
    fputs_unlocked(value->text, stdout);
    putc_unlocked('\n', stdout);
    value = value->next;
  }
  KVRReleaseContext(&context);
}

void Snapshot(const std::string &file) {
  const std::string bytes = ReadAll(file);
  // More than the legend and the longest line take.
  uint64_t size = 2048 + bytes.size() / sizeof(SnapshotRecord) * 1024;
  char *text = static_cast<char *>(std::malloc(size));
  if (KVRParseSnapshotBuffer(bytes.data(), bytes.size(), text, &size) != 1) std::abort();
  fwrite_unlocked(text, 1, size, stdout);
  std::free(text);
}

}  // namespace

int main(int argc, char **argv) {
  const std::string work = argc >= 3 ? argv[1] : "";
  if (work == "fleet" && argc == 4) {
    MakeFleet(argv[2], std::stoi(argv[3]));
  } else if (work == "make") {
    Make(argv[2]);
  } else if (work == "stats") {
    Stats(argv[2]);
  } else if (work == "snapshot") {
    Snapshot(argv[2]);
  } else {
    std::fputs("usage: library_work make|stats|snapshot PLACE, or fleet PLACE COUNT\n", stderr);
    return 2;
  }
}
