#pragma once

#include <CoreMoxelTypes/Basic.h>

#include <cmath>

namespace HostSources
{

using CoreMoxelTypes::D3;

inline D3 operator+( const D3& i_rA, const D3& i_rB )
{
  return { i_rA.x + i_rB.x, i_rA.y + i_rB.y, i_rA.z + i_rB.z };
}
inline D3 operator-( const D3& i_rA, const D3& i_rB )
{
  return { i_rA.x - i_rB.x, i_rA.y - i_rB.y, i_rA.z - i_rB.z };
}
inline D3 operator*( const D3& i_rA, double i_Scale )
{
  return { i_rA.x * i_Scale, i_rA.y * i_Scale, i_rA.z * i_Scale };
}
inline double Dot( const D3& i_rA, const D3& i_rB )
{
  return i_rA.x * i_rB.x + i_rA.y * i_rB.y + i_rA.z * i_rB.z;
}
inline D3 Cross( const D3& i_rA, const D3& i_rB )
{
  return { i_rA.y * i_rB.z - i_rA.z * i_rB.y, i_rA.z * i_rB.x - i_rA.x * i_rB.z, i_rA.x * i_rB.y - i_rA.y * i_rB.x };
}
inline double Length( const D3& i_rA )
{
  return std::sqrt( Dot( i_rA, i_rA ) );
}
inline D3 Unit( const D3& i_rA )
{
  return i_rA * ( 1.0 / Length( i_rA ) );
}

} // namespace HostSources
