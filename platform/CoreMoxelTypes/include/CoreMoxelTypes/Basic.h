#pragma once

// Units: millimetres, radians, newtons, newton millimetres, degrees Celsius, kilograms, pixels. The world is
// right-handed. Sensor pixels: x right, y down, (0, 0) is the centre of the top left pixel. Camera frame: x right,
// y down, z forward. Quaternions are (x, y, z, w). Colours are 0xAABBGGRR, in memory R, G, B, A. An absent number
// is NaN for a position and -1 for an index.

#include <array>
#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <utility>
#include <variant>
#include <vector>

namespace CoreMoxelTypes
{

using u8 = std::uint8_t;
using u16 = std::uint16_t;
using u32 = std::uint32_t;
using i32 = std::int32_t;
using u64 = std::uint64_t;
using f32 = float;
using f64 = double;

struct V2
{
  f32 x = 0, y = 0;
};
struct V3
{
  f32 x = 0, y = 0, z = 0;
};
struct D3
{
  f64 x = 0, y = 0, z = 0;
};

/// A rigid transform: `R` row-major, `T` in millimetres, applied to column vectors as R p + T.
struct Rigid
{
  f64 R[9] = { 1, 0, 0, 0, 1, 0, 0, 0, 1 };
  f64 T[3] = { 0, 0, 0 };
};

using VVariant = std::variant< bool, std::int64_t, f64, std::string >;

} // namespace CoreMoxelTypes
