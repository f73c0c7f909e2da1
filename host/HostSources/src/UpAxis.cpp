#include "UpAxis.h"

#include <array>
#include <cmath>
#include <cstdio>

namespace HostSources
{
namespace
{
/// 'X', 'Y' or 'Z' out of a text such as "+Y" or "-z"; 0 for any other text.
char ScreenAxis( const std::string& i_rText )
{
  for ( const char Character : i_rText )
  {
    const char Upper = static_cast< char >( Character & ~0x20 );
    if ( Upper >= 'X' && Upper <= 'Z' )
    {
      return Upper;
    }
    if ( Character != '+' && Character != '-' && Character != ' ' )
    {
      return 0;
    }
  }
  return 0;
}

std::string Millimetres( float i_Value )
{
  std::array< char, 48 > Text{};
  std::snprintf( Text.data(), Text.size(), "%.0f", static_cast< double >( i_Value ) );
  return Text.data();
}
} // namespace

void AddToBounds( VRecordingBounds& io_rBounds, std::span< const VRecordingPoint > i_Points )
{
  VRecordingBounds B = io_rBounds;
  // Comparisons with NaN are false, so missing points change nothing.
  for ( const VRecordingPoint& rP : i_Points )
  {
    B.Min = { rP.x < B.Min[0] ? rP.x : B.Min[0], rP.y < B.Min[1] ? rP.y : B.Min[1], rP.z < B.Min[2] ? rP.z : B.Min[2] };
    B.Max = { rP.x > B.Max[0] ? rP.x : B.Max[0], rP.y > B.Max[1] ? rP.y : B.Max[1], rP.z > B.Max[2] ? rP.z : B.Max[2] };
  }
  io_rBounds = B;
}

void ChooseUpAxisByData( VRecording& io_rRecording, const std::string& i_rWhy )
{
  const VRecordingBounds& rB = io_rRecording.Bounds;
  io_rRecording.UpAxis = EUpAxis::Z;
  if ( rB.IsEmpty() )
  {
    io_rRecording.UpAxisReason = "z is up: " + i_rWhy + ", and there are no points to tell by.";
    return;
  }
  const auto Range = [&]( std::size_t i_Axis )
  {
    return rB.Max[i_Axis] - rB.Min[i_Axis];
  };
  const auto Floor = [&]( std::size_t i_Axis )
  {
    return std::abs( rB.Min[i_Axis] );
  };
  const bool bNearest = Floor( 1 ) < Floor( 0 ) && Floor( 1 ) < Floor( 2 );
  const bool bLargest = Range( 1 ) > Range( 0 ) && Range( 1 ) > Range( 2 );
  io_rRecording.UpAxis = bNearest && bLargest ? EUpAxis::Y : EUpAxis::Z;
  io_rRecording.UpAxisReason = std::string( bNearest && bLargest ? "y" : "z" ) + " is up: " + i_rWhy +
                               ", and the smallest y, " + Millimetres( rB.Min[1] ) + " mm, is " +
                               ( bNearest ? "" : "not " ) +
                               "the nearest of the three axes to the floor, and its range, " +
                               Millimetres( Range( 1 ) ) + " mm, is " + ( bLargest ? "" : "not " ) + "the largest.";
}

void ChooseUpAxisByScreen( VRecording& io_rRecording, const std::string& i_rX, const std::string& i_rY )
{
  const char Right = ScreenAxis( i_rX );
  const char Up = ScreenAxis( i_rY );
  if ( Up == 'Y' || Up == 'Z' )
  {
    io_rRecording.UpAxis = Up == 'Y' ? EUpAxis::Y : EUpAxis::Z;
    io_rRecording.UpAxisReason = std::string( Up == 'Y' ? "y" : "z" ) + " is up: POINT:Y_SCREEN is \"" + i_rY + "\".";
    return;
  }
  if ( Up == 0 && ( Right == 'Y' || Right == 'Z' ) )
  {
    io_rRecording.UpAxis = Right == 'Y' ? EUpAxis::Z : EUpAxis::Y;
    io_rRecording.UpAxisReason = std::string( Right == 'Y' ? "z" : "y" ) + " is up: POINT:X_SCREEN is \"" + i_rX +
                                 "\", and there is no POINT:Y_SCREEN.";
    return;
  }
  ChooseUpAxisByData( io_rRecording, Up == 'X' ? "POINT:Y_SCREEN says x, which no view has up"
                                               : "POINT:X_SCREEN and Y_SCREEN do not tell" );
}

} // namespace HostSources
