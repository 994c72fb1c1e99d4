// SPDX-License-Identifier: Apache-2.0
// Arrays in NumPy's file format .npy, version 1.0: little-endian, C order, any rank.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

namespace qz::arrays {

enum class ElementType { kInt8, kUint16, kInt32, kFloat32 };

// "int8" and so on.
const char* NameOf(ElementType type);
size_t SizeOf(ElementType type);

// "()", "(382,)", "(3, 60)": as NumPy prints it.
std::string ShapeText(const std::vector<size_t>& shape);

struct NpyArray {
  ElementType type = ElementType::kInt8;
  std::vector<size_t> shape;  // empty: a single value
  std::string bytes;          // the values, the last index running fastest
};

template <typename T>
constexpr ElementType ElementTypeOf() {
  if constexpr (std::is_same_v<T, int8_t>) return ElementType::kInt8;
  if constexpr (std::is_same_v<T, uint16_t>) return ElementType::kUint16;
  if constexpr (std::is_same_v<T, int32_t>) return ElementType::kInt32;
  if constexpr (std::is_same_v<T, float>) return ElementType::kFloat32;
}

// `values` has as many elements as the shape.
template <typename T>
NpyArray MakeArray(std::vector<size_t> shape, const std::vector<T>& values) {
  NpyArray array{ElementTypeOf<T>(), std::move(shape), std::string(values.size() * sizeof(T), 0)};
  if (!values.empty()) std::memcpy(array.bytes.data(), values.data(), array.bytes.size());
  return array;
}

// The array is of type T.
template <typename T>
std::vector<T> ValuesOf(const NpyArray& array) {
  std::vector<T> values(array.bytes.size() / sizeof(T));
  if (!values.empty()) std::memcpy(values.data(), array.bytes.data(), array.bytes.size());
  return values;
}

// The bytes of a .npy file.
std::string NpyBytes(const NpyArray& array);

// The array of a whole .npy file, whose sizes must be those of its bytes. Throws
// base::InputError, which begins with `name`.
NpyArray ParseNpy(const std::string& bytes, const std::string& name);

}  // namespace qz::arrays
