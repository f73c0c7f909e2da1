#include "StandardScene.h"

#include <cmath>
#include <numbers>
#include <random>

namespace SubjectsBench
{
namespace
{
constexpr float Turn = 2 * std::numbers::pi_v< float >;

VPlace Looking( const VPoint& i_rFrom, VPoint i_Along )
{
  const float Length = std::hypot( i_Along.X, i_Along.Y, i_Along.Z );
  return { i_rFrom, { i_Along.X / Length, i_Along.Y / Length, i_Along.Z / Length } };
}

VPoint Sum( const VPoint& i_rA, const VPoint& i_rB )
{
  return { i_rA.X + i_rB.X, i_rA.Y + i_rB.Y, i_rA.Z + i_rB.Z };
}

void AddSubject( int i_Subject, int i_Subjects, float i_Time, const std::vector< VPoint >& i_rLocal,
                 VStandardData::VFrame& io_rFrame )
{
  const float Angle = Turn * static_cast< float >( i_Subject ) / static_cast< float >( i_Subjects ) + i_Time * 0.2F;
  const float Radius = 800 + 1800 * static_cast< float >( i_Subject % 5 ) / 5;
  const VPoint Centre{ Radius * std::cos( Angle ), Radius * std::sin( Angle ), 0 };
  const VPoint* const pLocal = i_rLocal.data() + i_Subject * MarkersPerSubject;
  for ( int Marker = 0; Marker < MarkersPerSubject; ++Marker )
  {
    VPoint Place = Sum( Centre, pLocal[Marker] );
    Place.X += 20 * std::sin( i_Time + static_cast< float >( Marker ) );
    io_rFrame.Markers.push_back( Place );
  }
  for ( int Segment = 0; Segment < SegmentsPerSubject; ++Segment )
  {
    const auto Number = static_cast< float >( Segment );
    io_rFrame.Segments.push_back(
        Looking( Sum( Centre, pLocal[Segment] ),
                 { std::sin( i_Time + Number ), std::cos( Number ), std::cos( i_Time + 2 * Number ) } ) );
  }
}
} // namespace

VStandardData::VStandardData( int i_Scale )
  : Scale( i_Scale )
{
  std::mt19937 Random( 20240711 );
  const auto Between = [&]( float i_Low, float i_High )
  {
    return i_Low + ( i_High - i_Low ) * static_cast< float >( Random() ) / 4294967296.0F;
  };
  const int CameraCount = CamerasPerScale * Scale, SubjectCount = SubjectsPerScale * Scale;
  for ( int Camera = 0; Camera < CameraCount; ++Camera )
  {
    const float Angle = Turn * static_cast< float >( Camera ) / static_cast< float >( CameraCount );
    const VPoint Place{ 5500 * std::cos( Angle ), 5500 * std::sin( Angle ), Camera % 2 != 0 ? 2800.0F : 2000.0F };
    Cameras.push_back( Looking( Place, { -Place.X, -Place.Y, 1000 - Place.Z } ) );
    HalfWidths.push_back( 350 + Between( 0, 200 ) );
  }
  std::vector< VPoint > Points, Local;
  const auto Anywhere = [&]( float i_Side, float i_Height )
  {
    const float X = Between( -i_Side, i_Side ), Y = Between( -i_Side, i_Side );
    return VPoint{ X, Y, Between( 0, i_Height ) };
  };
  for ( int Point = 0; Point < ReconstructionsPerScale * Scale; ++Point )
  {
    Points.push_back( Anywhere( 3000, 2200 ) );
  }
  for ( int Subject = 0; Subject < SubjectCount; ++Subject )
  {
    const auto Part = [&]
    {
      return static_cast< std::uint32_t >( 60 + Random() % 190 );
    };
    const std::uint32_t Red = Part(), Green = Part();
    SubjectColours.push_back( 0xFF000000 | Part() << 16 | Green << 8 | Red );
    for ( int Marker = 0; Marker < MarkersPerSubject; ++Marker )
    {
      Local.push_back( Anywhere( 300, 1800 ) );
    }
  }
  for ( int Number = 0; Number < FrameCount; ++Number )
  {
    const float Time = Turn * static_cast< float >( Number ) / FrameCount;
    VFrame& rFrame = Frames.emplace_back();
    for ( const VPoint& rPoint : Points )
    {
      rFrame.Reconstructions.push_back(
          { rPoint.X + 30 * std::sin( Time + rPoint.Y ), rPoint.Y + 30 * std::cos( Time + rPoint.X ), rPoint.Z } );
    }
    for ( int Subject = 0; Subject < SubjectCount; ++Subject )
    {
      AddSubject( Subject, SubjectCount, Time, Local, rFrame );
    }
  }
}

std::array< double, 9 > FromZ( const VPoint& i_rAlong )
{
  const double X = i_rAlong.X, Y = i_rAlong.Y, Z = i_rAlong.Z;
  if ( Z < -0.9999 )
  {
    return { 1, 0, 0, 0, -1, 0, 0, 0, -1 };
  }
  // The turn about z cross the direction, whose length is the sine of the angle and Z its cosine.
  const double Factor = 1 / ( 1 + Z );
  return { 1 - X * X * Factor, -X * Y * Factor, X, -X * Y * Factor, 1 - Y * Y * Factor, Y, -X, -Y, Z };
}

} // namespace SubjectsBench
