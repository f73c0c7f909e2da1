#pragma once

#include "VectorMath.h"

#include <algorithm>
#include <cstdint>
#include <iterator>

namespace HostSources::Simulation
{

inline constexpr double Pi = 3.14159265358979323846;

/// A place with axes; of a body: `X` forward, `Y` to the left, `Z` up.
struct VFrame
{
  D3 Origin, X{ 1, 0, 0 }, Y{ 0, 1, 0 }, Z{ 0, 0, 1 };

  D3 Point( double i_X, double i_Y, double i_Z ) const { return Origin + X * i_X + Y * i_Y + Z * i_Z; }
};

/// Turned by an angle to the left.
inline VFrame Yawed( const VFrame& i_rFrame, double i_Angle )
{
  const double C = std::cos( i_Angle ), S = std::sin( i_Angle );
  return { i_rFrame.Origin, i_rFrame.X * C + i_rFrame.Y * S, i_rFrame.Y * C - i_rFrame.X * S, i_rFrame.Z };
}
/// With the nose down.
inline VFrame Pitched( const VFrame& i_rFrame, double i_Angle )
{
  const double C = std::cos( i_Angle ), S = std::sin( i_Angle );
  return { i_rFrame.Origin, i_rFrame.X * C - i_rFrame.Z * S, i_rFrame.Y, i_rFrame.Z * C + i_rFrame.X * S };
}

/// The angle-axis vector of a rotation given by its rows.
inline D3 RotationVector( const D3& i_rX, const D3& i_rY, const D3& i_rZ )
{
  // By way of the quaternion part that is greatest, which holds up to half a turn.
  const double Trace = i_rX.x + i_rY.y + i_rZ.z;
  const double Q[4] = { 1 + Trace, 1 + i_rX.x - i_rY.y - i_rZ.z, 1 - i_rX.x + i_rY.y - i_rZ.z,
                        1 - i_rX.x - i_rY.y + i_rZ.z };
  const D3 Skew{ i_rZ.y - i_rY.z, i_rX.z - i_rZ.x, i_rY.x - i_rX.y };
  const double XY = i_rX.y + i_rY.x, XZ = i_rX.z + i_rZ.x, YZ = i_rY.z + i_rZ.y;
  const double Rows[4][4] = {
      { Q[0], Skew.x, Skew.y, Skew.z }, { Skew.x, Q[1], XY, XZ }, { Skew.y, XY, Q[2], YZ }, { Skew.z, XZ, YZ, Q[3] } };
  const auto Best = std::max_element( std::begin( Q ), std::end( Q ) ) - std::begin( Q );
  const double* pRow = Rows[Best];
  const double Sign = pRow[0] < 0 ? -1 : 1;
  const D3 Axis{ Sign * pRow[1], Sign * pRow[2], Sign * pRow[3] };
  const double Sine = Length( Axis );
  return Sine > 0 ? Axis * ( 2 * std::atan2( Sine, Sign * pRow[0] ) / Sine ) : D3{};
}

/// The rotation that leads from one frame's axes to another's, in those of the first.
inline D3 RotationVector( const VFrame& i_rFrom, const VFrame& i_rTo )
{
  const auto Row = [&]( const D3& i_rAxis )
  {
    return D3{ Dot( i_rAxis, i_rTo.X ), Dot( i_rAxis, i_rTo.Y ), Dot( i_rAxis, i_rTo.Z ) };
  };
  return RotationVector( Row( i_rFrom.X ), Row( i_rFrom.Y ), Row( i_rFrom.Z ) );
}

/// Numbers that look random and depend on nothing but what they are asked for: a frame is the same in whatever order
/// frames are made.
class VHash
{
public:
  explicit VHash( std::uint64_t i_Seed )
    : m_Value( Mixed( i_Seed + 0x9e3779b97f4a7c15u ) )
  {
  }
  VHash With( std::uint64_t i_Part ) const { return VHash( m_Value ^ Mixed( i_Part ) ); }

  std::uint64_t Bits() const { return m_Value; }
  /// From 0 to below 1.
  double Uniform() const { return static_cast< double >( m_Value >> 11 ) * 0x1p-53; }
  /// Three independent normal numbers.
  D3 Normal() const
  {
    const auto Pair = []( const VHash& i_rHash, double& o_rA, double& o_rB )
    {
      const double Radius = std::sqrt( -2 * std::log( 1 - i_rHash.Uniform() ) );
      const double Angle = 2 * Pi * i_rHash.With( 1 ).Uniform();
      o_rA = Radius * std::cos( Angle );
      o_rB = Radius * std::sin( Angle );
    };
    D3 Result;
    double Spare = 0;
    Pair( With( 2 ), Result.x, Result.y );
    Pair( With( 3 ), Result.z, Spare );
    return Result;
  }

private:
  static std::uint64_t Mixed( std::uint64_t i_Value )
  {
    i_Value = ( i_Value ^ ( i_Value >> 30 ) ) * 0xbf58476d1ce4e5b9u;
    i_Value = ( i_Value ^ ( i_Value >> 27 ) ) * 0x94d049bb133111ebu;
    return i_Value ^ ( i_Value >> 31 );
  }

  std::uint64_t m_Value;
};

} // namespace HostSources::Simulation
