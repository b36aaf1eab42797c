// The morwick command as people and scripts run it: output, messages, exit status.

#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <nlohmann/json.hpp>
#include <sstream>

#include "tests/process.h"

namespace {

const std::string kExamples = EXAMPLES "/";

std::string ReadFile(const std::string &path) {
  std::ifstream stream(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(stream), {}};
}

std::string Example(const std::string &name) { return ReadFile(kExamples + name); }

ProcessResult Morwick(std::vector<std::string> arguments, const std::string &input = "",
                      std::vector<std::string> environment = {}) {
  arguments.insert(arguments.begin(), MORWICK);
  return RunProcess(std::move(arguments), std::move(environment), input);
}

// A copy of the example header with one 32-bit field changed.
std::string HeaderWith(size_t offset, uint32_t value) {
  std::string header = Example("snapshot_header.bin");
  for (size_t i = 0; i < 4; ++i) header[offset + i] = static_cast<char>(value >> (8 * i));
  return TemporaryFile("header" + std::to_string(offset) + "_" + std::to_string(value), header);
}

struct CommandCase {
  std::vector<std::string> arguments;
  std::string input;
  int status;
  std::string out;  // how standard output begins; all of it when it does not begin with anything
  std::string err;
};

void Check(const std::vector<CommandCase> &cases) {
  for (const auto &[arguments, input, status, out, err] : cases) {
    SCOPED_TRACE(testing::PrintToString(arguments));
    const ProcessResult result = Morwick(arguments, input);
    EXPECT_EQ(result.status, status);
    EXPECT_EQ(result.out.substr(0, out.empty() ? std::string::npos : out.size()), out);
    EXPECT_EQ(result.err, err);
  }
}

TEST(CommandTest, PrintsGoodDataAndSaysWhatIsWrongWithBad) {
  const std::string kvr = Example("kvr.bin");
  const std::string legend = "Key: \nT   - Timestamp\n";
  const std::string stream = "morwick: standard input: ";
  const std::string sparse = TemporaryFile("sparse", "");
  std::filesystem::resize_file(sparse, uint64_t{5} << 30);
  const std::string unterminated = Example("snapshot_header.bin").substr(0, 40);
  const std::string hugeText =
      std::string(Example("snapshot_header.bin")).insert(36, std::string(70000, 'x'));
  std::string hugeTextMoved = hugeText;
  const uint32_t table = 36 + 70000 + 16;
  for (size_t i = 0; i < 4; ++i) hugeTextMoved[24 + i] = static_cast<char>(table >> (8 * i));
  const std::string bad = std::string("\1\0\0\x40\0\0\0\0", 8);  // a key above the highest
  Check({
      {{"stats", "-s", "kvr", kExamples + "kvr.bin"},
       "",
       0,
       "Summary\nexportVersion               : 7\nnumVirtualBlocks            : 4096\n",
       ""},
      {{"stats", "--stream", "ftl", "-"},
       Example("ftl.bin"),
       0,
       "version             : 5\nhostWriteXacts      : 45678\n",
       ""},
      {{"stats", "-s", "msp", "-"},
       Example("msp.bin"),
       0,
       "passWithTmodeHard       : 812345\n",
       ""},
      {{"stats", "-s", "kvr", "-o", "prometheus", "-c", "KVRStorage", "-"},
       kvr + kvr,
       0,
       "# HELP morwick_statistic A statistic that the storage controller reports.\n"
       "# TYPE morwick_statistic gauge\n"
       "morwick_statistic{controller=\"KVRStorage\",stream=\"kvr\",name=\"exportVersion\"} 7\n",
       ""},
      {{"stats", "-s", "kvr", "-"}, "", 1, "", stream + "the file is empty\n"},
      {{"stats", "-s", "kvr", "-"},
       "1234567",
       1,
       "Summary\n",
       stream + "a bad record ends the statistics after 0 entries\n"},
      {{"stats", "-s", "kvr", "-"},
       kvr + bad,
       1,
       "Summary\nexportVersion               : 0\n",
       stream + "a bad record ends the statistics after 17 entries\n"},
      {{"stats", "-s", "kvr", "-"},
       kvr.substr(0, kvr.size() - 8),
       1,
       "Summary\n",
       stream + "a bad record ends the statistics after 12 entries\n"},
      {{"stats", "-s", "ftl", "-"},
       Example("ftl.bin") + "abc",
       1,
       "version",
       stream + "the last 3 bytes are not a whole word\n"},
      {{"stats", "-s", "ftl", "-"}, bad, 1, "", stream + "no statistics found\n"},
      {{"stats", "-s", "ftl", "-"},
       std::string("\x0e\0\0\0\1\0\0\0\5\0\0\0\0\0\0\0", 16),
       1,
       "hostWriteLogHisto_ : 5\n",
       stream + "KVRFTLParseBufferToCxt: hostWriteLogHisto(14): (#10) cfg elements != (1) buffer "
                "elements\n"},
      {{"stats", "-s", "msp", "-c", "KVRStorage", "-"},
       "",
       2,
       "",
       stream + "KVRStorage has no MSP statistics\n"},
      {{"stats", "-s", "kvr", "-c", "Other", "-"},
       "",
       2,
       "",
       "morwick: --controller Other: not one of VeltoQRN3NVMeController, "
       "VeltoEmbeddedNVMeController, KVRStorage\n"},
      {{"stats", "-s", "kvr", "/no/such"},
       "",
       2,
       "",
       "morwick: /no/such: No such file or directory\n"},
      {{"stats", "-s", "kvr", "/tmp"}, "", 2, "", "morwick: /tmp: Is a directory\n"},
      {{"stats", "-s", "kvr", sparse},
       "",
       2,
       "",
       "morwick: " + sparse + ": larger than 4294967295 bytes\n"},
      {{"snapshot", kExamples + "snapshot.bin"}, "", 0, legend, ""},
      {{"snapshot", "-"},
       std::string(252, 'a') + "abc",
       1,
       legend,
       stream + "the last 3 bytes are not a whole record\n"},
      {{"snapshot", "-"}, "", 1, "", stream + "the file is empty\n"},
      {{"snapshot", "--header", kExamples + "snapshot_header.bin", kExamples + "snapshot.bin"},
       "",
       0,
       "- KVR Snapshot - \nExample layout\nT=0001 HR=9000 HW=4000",
       ""},
      {{"snapshot", "--header", kExamples + "snapshot_header.bin", "-"},
       std::string(600, 'a'),
       1,
       "- KVR Snapshot - \nExample layout\nT=1633771873",
       stream + "ends after 2 of 120 records that the header promises\n"},
      {{"snapshot", "--header", HeaderWith(8, 0), "-"},
       "x",
       1,
       "",
       "morwick: " + HeaderWith(8, 0) + ": record size 0 is too small\n"},
      {{"snapshot", "--header", HeaderWith(24, 221), "-"},
       "x",
       1,
       "",
       "morwick: " + HeaderWith(24, 221) +
           ": descriptor table offset 221 points outside the header of 228 bytes\n"},
      {{"snapshot", "--header", HeaderWith(24, 0xffffffff), "-"},
       "x",
       1,
       "",
       "morwick: " + HeaderWith(24, 0xffffffff) +
           ": descriptor table offset 4294967295 points outside the header of 228 bytes\n"},
      {{"snapshot", "--header", HeaderWith(52, 7), "-"},
       "x",
       1,
       "",
       "morwick: " + HeaderWith(52, 7) +
           ": descriptor count 7 points outside the header of 228 bytes\n"},
      {{"snapshot", "--header", TemporaryFile("short", "abc"), "-"},
       "x",
       1,
       "",
       "morwick: " + TemporaryFile("short", "abc") + ": a header of 3 bytes is shorter than 36\n"},
      {{"snapshot", "--header", TemporaryFile("endless", unterminated), "-"},
       "x",
       1,
       "",
       "morwick: " + TemporaryFile("endless", unterminated) +
           ": the text at offset 36 has no end\n"},
      {{"snapshot", "--header", TemporaryFile("huge", hugeTextMoved), "-"},
       std::string(504, 'a'),
       1,
       "",
       "morwick: " + TemporaryFile("huge", hugeTextMoved) +
           ": the text does not fit a buffer of 64 KiB\n"},
      {{"snapshot", "-o", "csv", "--header", "x", "y"},
       "",
       2,
       "",
       "morwick: --header: csv is for the fixed layout only (see morwick --help)\n"},
      {{"capacity", "0", "511", "30000", "1376256"}, "", 0, "0\n0\n32\n1536\n", ""},
      {{"capacity", "4294967296"},
       "",
       2,
       "",
       "morwick: Could not convert: MB = 4294967296 (see morwick --help)\n"},
      {{}, "", 2, "", "morwick: A subcommand is required (see morwick --help)\n"},
      {{"--version"}, "", 0, "morwick 1", ""},
      {{"stats", "--help"}, "", 0, "Print the statistics in a dump\nUsage: morwick stats", ""},
  });
}

TEST(CommandTest, FindsTheControllerOfTheScenario) {
  const auto find = [](const std::string &controllers) {
    return Morwick({"find"}, "", {"GRELLON_SCENARIO=" + TemporaryFile("find.toml", controllers)});
  };
  const std::string third = "[[controller]]\nclass = 'KVRStorage'\n";
  const ProcessResult found = find(third);
  EXPECT_EQ(found.status, 0);
  EXPECT_EQ(found.out, "controller : KVRStorage\nstatistics : kvr ftl\n");
  EXPECT_EQ(found.err.find("still open"), std::string::npos);
  const ProcessResult none = find("");
  EXPECT_EQ(none.status, 1);
  EXPECT_EQ(none.out, "");
  EXPECT_EQ(none.err, "Can't get KVR Connection, no matching service!\n");
  const ProcessResult refused = find(third + "refuse_open = true\n");
  EXPECT_EQ(refused.status, 1);
  EXPECT_NE(refused.err.find("Can't get KVR Connection!\n"), std::string::npos);
  EXPECT_EQ(refused.err.find("still open"), std::string::npos);
}

TEST(CommandTest, WritesJsonThatAParserReads) {
  const std::string repeated = Example("kvr.bin") + Example("kvr.bin");
  const auto json =
      nlohmann::json::parse(Morwick({"stats", "-s", "kvr", "-o", "json", "-"}, repeated).out);
  EXPECT_EQ(json["file"], "-");
  EXPECT_EQ(json["controller"], "VeltoQRN3NVMeController");
  EXPECT_EQ(json["stream"], "kvr");
  EXPECT_EQ(json["result"], 1);
  EXPECT_TRUE(json["message"].is_null());
  EXPECT_EQ(json["summary"]["hostWrites"], 123456789);
  EXPECT_EQ(json["summary"]["readCountHisto"], nlohmann::json({900, 80, 7, 1, 0}));
  EXPECT_EQ(json["summary"].size(), 18U);
  ASSERT_EQ(json["entries"].size(), 34U) << "repeats are kept";
  EXPECT_EQ(json["entries"][6], nlohmann::json({{"name", "hostWrites"}, {"value", 123456789}}));

  const std::string mismatch("\x0e\0\0\0\1\0\0\0\xff\xff\xff\xff\xff\xff\xff\xff", 16);
  const std::string odd = TemporaryFile("odd \xff \"name\"", mismatch);
  const auto ftl = nlohmann::json::parse(Morwick({"stats", "-s", "ftl", "-o", "json", odd}).out);
  EXPECT_TRUE(ftl["file"].get<std::string>().ends_with("odd \xef\xbf\xbd \"name\""));
  EXPECT_EQ(ftl["message"],
            "KVRFTLParseBufferToCxt: hostWriteLogHisto(14): (#10) cfg elements != (1) buffer "
            "elements");
  EXPECT_EQ(ftl["entries"][0]["value"], 18446744073709551615U);
  EXPECT_FALSE(ftl.contains("summary"));
}

TEST(CommandTest, GivesPrometheusTheLastValueOfEachName) {
  std::string second = Example("kvr.bin");
  second[8] = 9;  // the export version
  const std::string out =
      Morwick({"stats", "-s", "kvr", "-o", "prometheus", "-"}, Example("kvr.bin") + second).out;
  EXPECT_NE(out.find("name=\"exportVersion\"} 9\n"), std::string::npos) << out;
  EXPECT_EQ(std::count(out.begin(), out.end(), '\n'), 2 + 17);
}

// A line of the normal text, its numbers in turn.
std::vector<std::string> NumbersOf(const std::string &line) {
  std::vector<std::string> numbers;
  std::string number;
  for (const char c : line + " ") {
    if ((c >= '0' && c <= '9') || c == '.') {
      number += c;
    } else if (!number.empty()) {
      // Padding with zeros is for the eye.
      const size_t digits = number.find_first_not_of('0');
      const bool zero = digits == std::string::npos || number[digits] == '.';
      numbers.push_back(number.substr(
          zero ? number.find('.') == std::string::npos ? number.size() - 1 : digits - 1 : digits));
      number.clear();
    }
  }
  return numbers;
}

TEST(CommandTest, WritesTheSameNumbersAsCsvAndAsText) {
  // Every word of each record differs, so that no field can stand for another.
  std::string snapshot;
  for (uint32_t i = 0; i < 63 * 2500; ++i) {
    const uint32_t word = i * 7919 + 1;
    for (size_t k = 0; k < 4; ++k) snapshot += static_cast<char>(word >> (8 * k));
  }
  std::istringstream csv(Morwick({"snapshot", "-o", "csv", "-"}, snapshot).out);
  std::istringstream text(Morwick({"snapshot", "-"}, snapshot).out);
  std::string line;
  while (std::getline(text, line) && !line.starts_with("T=")) {
  }
  std::string row;
  std::getline(csv, row);
  EXPECT_TRUE(row.starts_with("T,E,HR,HW,NR,NW,TH,"));
  const auto columns = std::count(row.begin(), row.end(), ',') + 1;
  for (int i = 0; i < 2500; ++i) {
    ASSERT_TRUE(std::getline(csv, row)) << i;
    std::vector<std::string> fields;
    std::istringstream stream(row);
    for (std::string field; std::getline(stream, field, ',');) fields.push_back(field);
    ASSERT_EQ(static_cast<long>(fields.size()), columns);
    ASSERT_EQ(fields, NumbersOf(line)) << line;
    std::getline(text, line);
  }
  EXPECT_EQ(line, "") << "the text ends in an empty line";
  EXPECT_FALSE(std::getline(csv, row));
}

// However often the buffer of the in-place rendering fills, no record is lost.
TEST(CommandTest, LosesNoRecordAtAFullBuffer) {
  std::string snapshot;
  for (int i = 0; i < 17; ++i) snapshot += Example("snapshot.bin");
  const ProcessResult result =
      Morwick({"snapshot", "--header", HeaderWith(12, 17 * 120 + 1), "-"}, snapshot);
  EXPECT_EQ(result.status, 0);
  EXPECT_EQ(std::count(result.out.begin(), result.out.end(), '\n'), 2 + 17 * 120);
}

TEST(CommandTest, SaysWhenItsOutputCannotBeWritten) {
  const std::string dump = kExamples + "snapshot.bin";
  const auto shell = [&](const std::string &command) {
    return RunProcess({"bash", "-c", command, MORWICK, dump});
  };
  const ProcessResult full = shell("\"$0\" snapshot \"$1\" > /dev/full");
  EXPECT_EQ(full.status, 1);
  EXPECT_EQ(full.err, "morwick: standard output: No space left on device\n");
  const ProcessResult closed = shell("{ sleep 0.2; \"$0\" snapshot \"$1\"; echo $? >&2; } | true");
  EXPECT_EQ(closed.err, "morwick: standard output: Broken pipe\n1\n");
  const ProcessResult version = shell("\"$0\" --version > /dev/full");
  EXPECT_EQ(version.status, 1);
}

TEST(CommandTest, ShowsProgressOnATerminal) {
  // script gives the command a terminal as its standard error.
  const ProcessResult result =
      RunProcess({"script", "-qec",
                  "(head -c 100 " + kExamples + "snapshot.bin; sleep 1.2; tail -c +101 " +
                      kExamples + "snapshot.bin) | " MORWICK " snapshot - > /dev/null",
                  "/dev/null"});
  EXPECT_NE(result.out.find("\rmorwick: standard input: 29 KiB read"), std::string::npos)
      << result.out;
  EXPECT_EQ(result.status, 0);
}

}  // namespace
