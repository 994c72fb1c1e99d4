// SPDX-License-Identifier: Apache-2.0
#include "arrays/npy_file.h"

#include <algorithm>
#include <string_view>

#include "base/error.h"

namespace qz::arrays {
namespace {

constexpr std::string_view kMagic = "\x93NUMPY";
constexpr size_t kHeaderOffset = 10;  // behind the magic, two bytes of version and two of length
constexpr size_t kAlignment = 64;     // of the values in the file

struct Type {
  ElementType type;
  const char* descr;
  const char* name;
  size_t size;
};
constexpr Type kTypes[] = {{ElementType::kInt8, "|i1", "int8", 1},
                           {ElementType::kUint16, "<u2", "uint16", 2},
                           {ElementType::kInt32, "<i4", "int32", 4},
                           {ElementType::kFloat32, "<f4", "float32", 4}};

const Type& TypeOf(ElementType type) {
  return *std::find_if(std::begin(kTypes), std::end(kTypes),
                       [type](const Type& each) { return each.type == type; });
}

// The header: a Python dictionary of three entries in any order.
class HeaderParser {
 public:
  HeaderParser(std::string_view text, const std::string& name) : text_(text), name_(name) {}

  void Run() {
    Expect('{');
    while (!Take('}')) {
      ParseEntry();
      if (!Take(',') && !Sees('}')) Fail("a comma or }");
    }
    SkipSpace();
    if (location_ != text_.size()) Fail("nothing more");
    if (descr_.empty() || order_.empty() || !has_shape_) {
      throw base::InputError(name_ + ": the header should give descr, fortran_order and shape");
    }
  }

  const std::string& descr() const { return descr_; }
  bool fortran_order() const { return order_ == "True"; }
  const std::vector<size_t>& shape() const { return shape_; }

 private:
  [[noreturn]] void Fail(const char* expected) const {
    throw base::InputError(name_ + ": byte " + std::to_string(kHeaderOffset + location_) +
                           " of the header should be " + expected);
  }

  void SkipSpace() {
    while (location_ < text_.size() && (text_[location_] == ' ' || text_[location_] == '\n'))
      ++location_;
  }
  bool Sees(char wanted) {
    SkipSpace();
    return location_ < text_.size() && text_[location_] == wanted;
  }
  bool Take(char wanted) {
    const bool there = Sees(wanted);
    location_ += there;
    return there;
  }
  void Expect(char wanted) {
    if (!Take(wanted)) Fail((std::string(1, wanted)).c_str());
  }

  void ParseEntry() {
    const std::string key = QuotedText();
    Expect(':');
    if (key == "descr") {
      descr_ = QuotedText();
    } else if (key == "fortran_order") {
      order_ = Truth();
    } else if (key == "shape") {
      ParseShape();
    } else {
      Fail("the value of descr, fortran_order or shape");
    }
  }

  // Of printable characters only: it may be shown.
  std::string QuotedText() {
    const char quote = Sees('"') ? '"' : '\'';
    Expect(quote);
    const size_t begin = location_;
    while (location_ < text_.size() && text_[location_] != quote) {
      if (text_[location_] < ' ' || text_[location_] > '~') Fail("printable");
      ++location_;
    }
    std::string quoted(text_.substr(begin, location_ - begin));
    Expect(quote);
    return quoted;
  }

  std::string Truth() {
    SkipSpace();
    for (const char* word : {"True", "False"}) {
      const size_t length = std::strlen(word);
      if (text_.substr(location_, length) == word) {
        location_ += length;
        return word;
      }
    }
    Fail("True or False");
  }

  void ParseShape() {
    has_shape_ = true;
    shape_.clear();
    Expect('(');
    while (!Take(')')) {
      shape_.push_back(Number());
      if (!Take(',') && (shape_.size() == 1 || !Sees(')'))) Fail("a comma");
    }
  }

  size_t Number() {
    SkipSpace();
    const size_t begin = location_;
    size_t number = 0;
    for (; location_ < text_.size() && text_[location_] >= '0' && text_[location_] <= '9';
         ++location_) {
      if (__builtin_mul_overflow(number, size_t{10}, &number) ||
          __builtin_add_overflow(number, static_cast<size_t>(text_[location_] - '0'), &number)) {
        Fail("of a smaller number");
      }
    }
    if (location_ == begin) Fail("a digit");
    return number;
  }

  std::string_view text_;
  const std::string& name_;
  size_t location_ = 0;
  std::string descr_;
  std::string order_;
  bool has_shape_ = false;
  std::vector<size_t> shape_;
};

ElementType ParseType(const std::string& descr, const std::string& name) {
  for (const Type& each : kTypes) {
    if (descr == each.descr) return each.type;
  }
  throw base::InputError(
      name + ": its values are of type '" + descr.substr(0, 16) +
      "', should be '|i1', '<u2', '<i4' or '<f4': int8, uint16, int32 or float32, " +
      "little-endian");
}

void CheckSize(const NpyArray& array, const std::string& name) {
  size_t size = SizeOf(array.type);
  bool overflow = false;
  for (const size_t extent : array.shape) {
    overflow = __builtin_mul_overflow(size, extent, &size) || overflow;
  }
  if (!overflow && size == array.bytes.size()) return;
  throw base::InputError(name + ": its shape " + ShapeText(array.shape) + " of " +
                         NameOf(array.type) + " takes " +
                         (overflow ? "more than memory has" : std::to_string(size) + " bytes") +
                         ", there are " + std::to_string(array.bytes.size()));
}

}  // namespace

const char* NameOf(ElementType type) { return TypeOf(type).name; }

size_t SizeOf(ElementType type) { return TypeOf(type).size; }

std::string ShapeText(const std::vector<size_t>& shape) {
  std::string text = "(";
  for (size_t i = 0; i < shape.size(); ++i) {
    text += (i > 0 ? ", " : "") + std::to_string(shape[i]);
  }
  return text + (shape.size() == 1 ? ",)" : ")");
}

std::string NpyBytes(const NpyArray& array) {
  std::string header = "{'descr': '" + std::string(TypeOf(array.type).descr) +
                       "', 'fortran_order': False, 'shape': " + ShapeText(array.shape) + ", }";
  const size_t end = kHeaderOffset + header.size() + 1;  // the line end
  header.append((kAlignment - end % kAlignment) % kAlignment, ' ');
  header += '\n';
  std::string bytes(kMagic);
  bytes += {1, 0, static_cast<char>(header.size() % 256), static_cast<char>(header.size() / 256)};
  return bytes + header + array.bytes;
}

NpyArray ParseNpy(const std::string& bytes, const std::string& name) {
  if (bytes.compare(0, kMagic.size(), kMagic) != 0 || bytes.size() < kHeaderOffset) {
    throw base::InputError(name + ": not an array in NumPy's format");
  }
  const auto byte = [&bytes](size_t i) { return static_cast<uint8_t>(bytes[i]); };
  if (byte(6) != 1 || byte(7) != 0) {
    throw base::InputError(name + ": of version " + std::to_string(byte(6)) + "." +
                           std::to_string(byte(7)) + " of NumPy's format, should be 1.0");
  }
  const size_t length = byte(8) + size_t{256} * byte(9);
  if (bytes.size() - kHeaderOffset < length) {
    throw base::InputError(name + ": cut off: its header has " + std::to_string(length) +
                           " bytes, there are " + std::to_string(bytes.size() - kHeaderOffset));
  }
  HeaderParser header(std::string_view(bytes).substr(kHeaderOffset, length), name);
  header.Run();
  if (header.fortran_order()) {
    throw base::InputError(name + ": its values are in Fortran order, should be in C order");
  }
  NpyArray array{ParseType(header.descr(), name), header.shape(),
                 bytes.substr(kHeaderOffset + length)};
  CheckSize(array, name);
  return array;
}

}  // namespace qz::arrays
