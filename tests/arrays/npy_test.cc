// SPDX-License-Identifier: Apache-2.0
// Arrays and archives of arrays: what NumPy wrote comes back, what is written is what NumPy writes,
// and what is damaged or not for us is refused.

#include <gmock/gmock.h>

#include "arrays/npz_file.h"
#include "base/error.h"
#include "tests/support/temporary_folder.h"

namespace qz::arrays {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;

// What NumPy 1.24 saves: a header of 128 bytes, and the values.
std::string Saved(const std::string& dictionary, const std::string& values) {
  std::string header = dictionary;
  header.resize(117, ' ');
  return std::string("\x93NUMPY\x01\0v\0", 10) + header + "\n" + values;
}

std::string Header(const std::string& descr, const std::string& shape) {
  return "{'descr': '" + descr + "', 'fortran_order': False, 'shape': " + shape + ", }";
}

std::string ErrorOf(const std::string& bytes) {
  try {
    ParseNpy(bytes, "x");
  } catch (const base::InputError& error) {
    return error.what();
  }
  return "none";
}

TEST(Npy, IsWhatNumPySavesAndLoads) {
  const std::string matrix = Saved(Header("<u2", "(2, 3)"), {"\1\0\2\0\3\0\4\0\5\0\xFF\xFF", 12});
  EXPECT_EQ(NpyBytes(MakeArray<uint16_t>({2, 3}, {1, 2, 3, 4, 5, 65535})), matrix);
  EXPECT_THAT(ValuesOf<uint16_t>(ParseNpy(matrix, "x")), ElementsAre(1, 2, 3, 4, 5, 65535));
  const std::string vector = Saved(Header("<f4", "(2,)"), {"\0\0\xC0\xBF\xCD\xCC\xCC\x3D", 8});
  EXPECT_EQ(NpyBytes(MakeArray<float>({2}, {-1.5f, 0.1f})), vector);
  EXPECT_THAT(ValuesOf<float>(ParseNpy(vector, "x")), ElementsAre(-1.5f, 0.1f));
  const std::string single = Saved(Header("<i4", "()"), "\xFE\xFF\xFF\xFF");
  EXPECT_EQ(NpyBytes(MakeArray<int32_t>({}, {-2})), single);
  EXPECT_THAT(ValuesOf<int32_t>(ParseNpy(single, "x")), ElementsAre(-2));
  const std::string none = Saved(Header("|i1", "(0, 48)"), "");
  EXPECT_EQ(NpyBytes(MakeArray<int8_t>({0, 48}, {})), none);
  EXPECT_THAT(ParseNpy(none, "x").shape, ElementsAre(0, 48));
  // Any order, spacing and quotes.
  const std::string other = "{\"shape\":(1,1 ,), 'fortran_order' : False,'descr':'|i1'}";
  EXPECT_THAT(ParseNpy(Saved(other, "\x80"), "x").shape, ElementsAre(1, 1));
}

TEST(Npy, NamesTheValueAndWhatIsExpected) {
  const std::string good = Header("|i1", "(2,)");
  const std::pair<std::string, const char*> cases[] = {
      {"", "x: not an array in NumPy's format"},
      {Saved(good, "ab").replace(6, 1, "\2"), "x: of version 2.0 of NumPy's format, should be 1.0"},
      {Saved(good, "ab").substr(0, 100), "x: cut off: its header has 118 bytes, there are 90"},
      {Saved(good, "a"), "x: its shape (2,) of int8 takes 2 bytes, there are 1"},
      {Saved(Header("<f4", "(1073741824, 1073741824, 4)"), ""),
       "takes more than memory has, there"},
      {Saved(Header("|i1", "(99999999999999999999,)"), ""), "of the header should be of a smaller"},
      {Saved(Header("|i1", "(-1,)"), ""), "of the header should be a digit"},
      {Saved(Header("|i1", "(2)"), "ab"), "of the header should be a comma"},
      {Saved(Header(">i4", "(1,)"), "abcd"), "x: its values are of type '>i4', should be '|i1'"},
      {Saved(Header("\x1B[31m", "()"), "a"), "of the header should be printable"},
      {Saved("{'descr': [('a', '<f4')], }", ""), "x: byte 20 of the header should be '"},
      {Saved("{'descr': '|i1', 'fortran_order': True, 'shape': (2,)}", "ab"), "in Fortran order"},
      {Saved("{'descr': '|i1', 'fortran_order': False}", "a"), "x: the header should give descr,"},
      {Saved("{'fortran_order': Maybe}", "a"), "x: byte 28 of the header should be True or False"},
      {Saved(good + "}", "ab"), "of the header should be nothing more"}};
  for (const auto& [bytes, error] : cases) EXPECT_THAT(ErrorOf(bytes), HasSubstr(error));
}

// Two deflated arrays, by NumPy's savez_compressed: x, int8 [7, -8, 9], and w0.bias, int32
// [[70000]].
constexpr char kNumPyArchive[] =
    "504b030414000000080000002100550d1c64470000008300000005001400782e6e7079010010008300000000000000"
    "47000000000000009bec17ea1b10c9c850c650ad9e925a9c5ca46ea5a05e9369a8aea3a09e965f54529498179f5f94"
    "920a12774bcc294e058a17672416a402f91ac63a9a3a0ab50a14002ef61f9c00504b030414000000080000002100f3"
    "622c084a000000840000000b00140077302e626961732e6e70790100100084000000000000004a000000000000009b"
    "ec17ea1b10c9c850c650ad9e925a9c5ca46ea5a06e9369a2aea3a09e965f54529498179f5f94920a12774bcc294e05"
    "8a17672416a402f91a863a0a869a3a0ab50a6403ae0241460600504b0102140314000000080000002100550d1c6447"
    "00000083000000050000000000000000000000800100000000782e6e7079504b010214031400000008000000210"
    "0f3622c084a000000840000000b000000000000000000000080017e00000077302e626961732e6e7079504b050600"
    "000000020002006c000000050100000000";

std::string FromHex(const std::string& hex) {
  std::string bytes;
  for (size_t i = 0; i < hex.size(); i += 2) {
    bytes += static_cast<char>(std::stoi(hex.substr(i, 2), nullptr, 16));
  }
  return bytes;
}

class Npz : public testing::Test {
 protected:
  // Empty if the bytes are an archive.
  std::string ErrorOf(const std::string& bytes, const NpzLimits& limits = {2, 256}) {
    try {
      ReadNpz(folder_.WriteBytes("a.npz", bytes), limits);
    } catch (const base::InputError& error) {
      return std::string(error.what()).substr(folder_.Path("a.npz").size());
    }
    return {};
  }

  const test::TemporaryFolder folder_;
  const std::string archive_ = FromHex(kNumPyArchive);
};

TEST_F(Npz, HoldsWhatWasPutIn) {
  const auto arrays = ReadNpz(folder_.WriteBytes("a.npz", archive_), {2, 256});
  EXPECT_THAT(ValuesOf<int8_t>(arrays.at("x")), ElementsAre(7, -8, 9));
  EXPECT_THAT(ValuesOf<int32_t>(arrays.at("w0.bias")), ElementsAre(70000));

  const std::string bytes = NpzBytes({arrays.begin(), arrays.end()});
  const auto again = ReadNpz(folder_.WriteBytes("b.npz", bytes), {2, 256});
  ASSERT_EQ(again.size(), 2u);
  EXPECT_EQ(again.at("w0.bias").shape, arrays.at("w0.bias").shape);
  EXPECT_EQ(again.at("x").bytes, arrays.at("x").bytes);
  EXPECT_EQ(bytes.substr(8, 6), std::string("\0\0\0\0\x21\0", 6)) << "stored, midnight, 1980-01-01";
}

TEST_F(Npz, RefusesWhatIsTooLargeOrDamaged) {
  EXPECT_EQ(ErrorOf(archive_), "");
  EXPECT_EQ(ErrorOf(archive_, {1, 256}), ": more than 1 arrays");
  EXPECT_EQ(ErrorOf(archive_, {2, 131}), ": w0.bias: has 132 bytes, should have at most 131");
  std::string bomb = archive_;
  bomb.replace(bomb.find("PK\1\2") + 24, 4, "\xFF\xFF\xFF\x7F");
  EXPECT_EQ(ErrorOf(bomb), ": x: has 2147483647 bytes, should have at most 256");
  std::string wrong_sum = archive_;
  ++wrong_sum[wrong_sum.find("PK\1\2") + 16];
  EXPECT_THAT(ErrorOf(wrong_sum), HasSubstr(": x: damaged"));
  wrong_sum = archive_;
  ++wrong_sum[wrong_sum.find("PK\3\4", 4) - 4];
  EXPECT_THAT(ErrorOf(wrong_sum), HasSubstr(": x: damaged"));
  std::string other_method = archive_;
  other_method[other_method.find("PK\1\2") + 10] = 12;
  EXPECT_THAT(ErrorOf(other_method), HasSubstr(": x: is encrypted or packed by another method"));
  EXPECT_EQ(ErrorOf("no archive"), ": not an archive of arrays (.npz)");
  EXPECT_THROW(ReadNpz(folder_.Path("absent"), {2, 256}), base::InputError);
  // The last two bytes are only the length of a comment.
  for (size_t size = 0; size < archive_.size() - 2; size += 3) {
    EXPECT_NE(ErrorOf(archive_.substr(0, size)), "") << size;
  }
  std::string renamed = archive_;
  renamed.replace(renamed.rfind("x.npy"), 5, "x\x1B.np");
  EXPECT_EQ(ErrorOf(renamed), ": holds 'x?.np', should hold names that end in .npy");
}

// Whatever a byte turns into, it ends in an error or an archive.
TEST_F(Npz, OutlivesAnyByte) {
  int refused = 0;
  for (size_t location = 0; location < archive_.size(); ++location) {
    std::string bytes = archive_;
    bytes[location] ^= "\x01\x80\xFF"[location % 3];
    refused += !ErrorOf(bytes).empty();
  }
  EXPECT_GT(refused, 200);
}

}  // namespace
}  // namespace qz::arrays
