// In the place of the generated header: tables that are filled in at run time.
#pragma once

#include "network/loaded/loaded_network.h"

namespace {

constexpr const unsigned char* w0 = qz::loaded_tables;
constexpr const unsigned char* w1 = w0 + 528;
constexpr const unsigned char* w3 = w1 + 3584;
constexpr const unsigned char* w4 = w3 + 704;
constexpr const unsigned char* w6 = w4 + 4352;
constexpr const unsigned char* w8 = w6 + 12032;
constexpr const unsigned char* w10 = w8 + 12032;
constexpr const unsigned char* w12 = w10 + 12032;
constexpr const unsigned char* w13 = w12 + 12032;
constexpr const unsigned char* w15 = w13 + 12032;
constexpr const unsigned char* w17 = w15 + 12032;
constexpr const unsigned char* w18 = w17 + 4096;
static_assert(528 + 3584 + 704 + 4352 + 6 * 12032 + 4096 + 544 == qz::kLoadedTableBytes);

}  // namespace
