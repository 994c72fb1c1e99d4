// SPDX-License-Identifier: Apache-2.0
// Traces of a few records: written, read, cut short, and compared with others that differ in one
// value.

#include <gmock/gmock.h>

#include <cstdlib>

#include "trace/comparison.h"

namespace qz::trace {
namespace {

using testing::HasSubstr;

// Both nanoapps log and send the same; the linked one computes two frames and two network runs.
std::vector<Record> GoodTrace() {
  std::vector<Record> trace;
  for (const uint32_t nanoapp : {kLoadedModule, kLinkedNanoapp}) {
    trace.push_back({Kind::kPlayed, nanoapp, 0, 0, {}});
    trace.push_back({Kind::kLogLine, 2, 0, 0, {'G', 'o'}});
    trace.push_back({Kind::kHostMessage, 16, 4, 0, {}});
    for (uint8_t round = 0; round < 2 && nanoapp == kLinkedNanoapp; ++round) {
      trace.push_back({Kind::kFeatures, 0, 0, 0, std::vector<uint8_t>(96, round)});
      for (uint32_t op = 0; op < kOperatorsPerRun; ++op) {
        trace.push_back({Kind::kOperatorOutput, op, 5, 0, std::vector<uint8_t>(20, round)});
      }
    }
    trace.push_back({Kind::kPlayed, nanoapp, 1, 2'000'000'000, {}});
    trace.push_back({Kind::kMemory, 0, 48, 2'000'000'000, std::vector<uint8_t>(96)});
    trace.push_back({Kind::kClientEvent, 257, 0x8207, 2'000'000'000, {1, 0, 0, 0, 8}});
  }
  return trace;
}

std::string Written(const std::vector<Record>& records) {
  char* bytes = nullptr;
  size_t size = 0;
  std::FILE* file = open_memstream(&bytes, &size);
  Writer writer(file);
  for (const Record& record : records) writer.Write(record);
  writer.End();
  std::fclose(file);
  std::string stream(bytes, size);
  std::free(bytes);
  return stream;
}

// The records up to the end record, and the error that ended the stream early.
std::vector<Record> Read(const std::string& stream, std::string* error) {
  size_t location = 0;
  Reader reader([&](uint8_t* bytes, size_t size) {
    // In small pieces, as from a pipe.
    const size_t given =
        stream.copy(reinterpret_cast<char*>(bytes), std::min<size_t>(size, 7), location);
    location += given;
    return given;
  });
  std::vector<Record> records;
  try {
    for (Record record; reader.Next(&record), record.kind != Kind::kEnd;) records.push_back(record);
  } catch (const TraceError& refused) {
    *error = refused.what();
  }
  return records;
}

std::string ErrorOf(const std::string& stream) {
  std::string error;
  Read(stream, &error);
  return error;
}

std::string Compared(const std::vector<Record>& first, const std::vector<Record>& second) {
  Comparison comparison("A", "B");
  for (size_t i = 0; i <= std::min(first.size(), second.size()); ++i) {
    std::string difference = comparison.Compare(i < first.size() ? first[i] : Record(),
                                                i < second.size() ? second[i] : Record());
    if (!difference.empty()) return difference;
  }
  return comparison.NanoappsDiffer();
}

TEST(Trace, ComesBackAsWritten) {
  std::string error;
  const std::vector<Record> records = Read(Written(GoodTrace()), &error);
  EXPECT_EQ(error, "");
  EXPECT_EQ(records.size(), GoodTrace().size());
  EXPECT_EQ(Compared(records, GoodTrace()), "");
  // Kind, number, type, time and size of the second record, behind the 21 bytes of the first.
  const char log_line[] = "\x02\x02\0\0\0\0\0\0\0\0\0\0\0\0\0\0\0\x02\0\0\0Go";
  EXPECT_EQ(Written(GoodTrace()).substr(21, 23), std::string(log_line, 23));
}

TEST(Trace, IsWholeOrNone) {
  const std::string whole = Written(GoodTrace());
  for (size_t size = 0; size < whole.size(); ++size) {
    ASSERT_THAT(ErrorOf(whole.substr(0, size)), HasSubstr("cut off")) << size;
  }
  EXPECT_THAT(ErrorOf(whole + "x"), HasSubstr("bytes behind the end record"));
  EXPECT_EQ(ErrorOf(whole.substr(21)),
            "record " + std::to_string(GoodTrace().size() - 1) +
                " of the trace: the end record counts 4 records of kind 1, there were 3");
  EXPECT_THAT(ErrorOf("x" + whole), HasSubstr("record 0 of the trace: its kind is 120"));
  std::string large = whole;
  large[19] = 2;
  EXPECT_THAT(ErrorOf(large), HasSubstr("it has 131072 bytes, should be at most 65536"));
}

TEST(Trace, FirstDifferenceIsNamed) {
  constexpr size_t kLog = 1, kMessage = 2, kMemory = 4, kReport = 5, kSecondFeatures = 31,
                   kSecondRun = 32;
  const auto with = [](size_t location, auto change) {
    std::vector<Record> trace = GoodTrace();
    change(trace[location]);
    return trace;
  };
  const std::string in_second = " (the linked nanoapp at 0.000 s): ";
  const std::string in_first = " (the loaded module at 0.000 s): ";
  const std::pair<std::vector<Record>, std::string> cases[] = {
      {with(kLog, [](Record& r) { r.bytes[1] = 'O'; }),
       "log line 0" + in_first + "\"Go\" in A, \"GO\" in B"},
      {with(kLog, [](Record& r) { r.number = 1; }),
       "log line 0, level" + in_first + "2 in A, 1 in B"},
      {with(kMessage, [](Record& r) { r.bytes = {7}; }),
       "message to hosts 0, size" + in_first + "0 bytes in A, 1 bytes in B"},
      {with(kMessage, [](Record& r) { r.type = 6; }),
       "message to hosts 0, type" + in_first + "4 in A, 6 in B"},
      {with(kMemory, [](Record& r) { r.bytes[50] = 0xFF; }),
       "memory after buffer 0, inference_input_buffer, frame 1, channel 2 (the loaded module at "
       "2.000 s): 0 in A, -1 in B"},
      {with(kReport, [](Record& r) { r.bytes[4] = 9; }),
       "event to client nanoapps 0, byte 4 (the loaded module at 2.000 s): 8 in A, 9 "
       "in B"},
      {with(kReport, [](Record& r) { ++r.time_ns; }),
       "event to client nanoapps 0, time in ns (the loaded module at 2.000 s): "
       "2000000000 in A, 2000000001 in B"},
      {with(kReport, [](Record& r) { r.kind = Kind::kLogLine; }),
       "event to client nanoapps 0 (the loaded module at 2.000 s): "
       "event to client nanoapps in A, log line in B"},
      {with(kSecondFeatures, [](Record& r) { r.bytes[95] = 2; }),
       "features of frame 1, channel 47" + in_second + "257 in A, 513 in B"},
      {with(kSecondRun + 7, [](Record& r) { r.bytes[13] = 0xFF; }),
       "network run 1, operator 7, row 2, channel 3" + in_second + "1 in A, -1 in B"},
      {with(kSecondRun + 20,
            [](Record& r) {
              r.bytes = {1, 1, 1, 1, 0, 0, 0x80, 0x3E};
              r.bytes.resize(20, 1);
            }),
       "network run 1, operator 20, row 0, channel 1" + in_second + "0.000000 in A, 0.250000 in B"},
      {{GoodTrace()[0], GoodTrace()[1]},
       "message to hosts 0" + in_first + "message to hosts in A, end of the trace in B"},
  };
  for (const auto& [second, difference] : cases) {
    EXPECT_EQ(Compared(GoodTrace(), second), difference);
  }
}

TEST(Trace, NanoappsThatDifferAreNamed) {
  std::vector<Record> trace = GoodTrace();
  trace.back().bytes[4] = 9;
  EXPECT_EQ(
      Compared(trace, trace),
      "event to client nanoapps: 1 of the loaded module and 1 of the linked nanoapp are not the "
      "same");
  trace.erase(trace.begin() + 1);
  EXPECT_THAT(Compared(trace, trace), HasSubstr("log line: 0 of the loaded module and 1 of"));
}

}  // namespace
}  // namespace qz::trace
