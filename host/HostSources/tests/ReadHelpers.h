#pragma once

#include "C3dWriter.h"

#include <HostSources/ReadRecording.h>
#include <HostSources/RecordingInfo.h>
#include <HostSources/VC3dReader.h>
#include <HostSources/VTrcReader.h>

#include <TestSupport/Paths.h>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string_view>

namespace HostSources
{

/// What a reader gave, failures included.
struct VOutcome
{
  ZEK::IResult Result;
  std::string Message;
  VRecording Recording;
};

inline VRecording MustRead( const std::filesystem::path& i_rPath, ZEK::IResult i_Expected = ZEK::IResult::Ok )
{
  VRecording Recording;
  std::string Message;
  EXPECT_EQ( ReadRecording( i_rPath, Recording, Message ), i_Expected ) << Message;
  return Recording;
}

/// One of the recordings beside the checkout.
inline VRecording Real( const char* i_pFile )
{
  return MustRead( TestSupport::RecordingsDir() / i_pFile );
}

inline VRecording MustReadC3d( const C3dWriter::VFile& i_rFile )
{
  VRecording Recording;
  std::string Message;
  EXPECT_EQ( ReadC3d( C3dWriter::Write( i_rFile ), "made.c3d", Recording, Message ), ZEK::IResult( ZEK::IResult::Ok ) )
      << Message;
  return Recording;
}

inline std::span< const std::byte > Bytes( std::string_view i_Text )
{
  return std::as_bytes( std::span( i_Text ) );
}

inline VOutcome ReadText( std::string_view i_Text )
{
  VOutcome Outcome;
  Outcome.Result = ReadTrc( Bytes( i_Text ), "made.trc", Outcome.Recording, Outcome.Message );
  return Outcome;
}

inline VRecording MustReadTrc( std::string_view i_Text )
{
  VOutcome Outcome = ReadText( i_Text );
  EXPECT_EQ( Outcome.Result, ZEK::IResult( ZEK::IResult::Ok ) ) << Outcome.Message;
  return Outcome.Recording;
}

inline std::size_t LabelIndex( const VRecording& i_rRecording, const std::string& i_rLabel )
{
  const auto It = std::find( i_rRecording.Labels.begin(), i_rRecording.Labels.end(), i_rLabel );
  EXPECT_NE( It, i_rRecording.Labels.end() ) << i_rLabel;
  return It == i_rRecording.Labels.end() ? 0 : static_cast< std::size_t >( It - i_rRecording.Labels.begin() );
}

inline void ExpectPoint( const VRecordingPoint& i_rPoint, double i_X, double i_Y, double i_Z, double i_Tolerance )
{
  EXPECT_NEAR( static_cast< double >( i_rPoint.x ), i_X, i_Tolerance );
  EXPECT_NEAR( static_cast< double >( i_rPoint.y ), i_Y, i_Tolerance );
  EXPECT_NEAR( static_cast< double >( i_rPoint.z ), i_Z, i_Tolerance );
}

inline void ExpectPoint( const VRecording& i_rRecording, std::int64_t i_Frame, const std::string& i_rLabel, double i_X,
                         double i_Y, double i_Z, double i_Tolerance = 1e-4 )
{
  SCOPED_TRACE( i_rLabel + " at index " + std::to_string( i_Frame ) );
  ExpectPoint( i_rRecording.Frame( i_Frame )[LabelIndex( i_rRecording, i_rLabel )], i_X, i_Y, i_Z, i_Tolerance );
}

inline void ExpectBounds( const VRecordingBounds& i_rBounds, std::array< double, 6 > i_MinMax, double i_Tolerance )
{
  for ( std::size_t Axis = 0; Axis < 3; ++Axis )
  {
    EXPECT_NEAR( static_cast< double >( i_rBounds.Min[Axis] ), i_MinMax[2 * Axis], i_Tolerance ) << Axis;
    EXPECT_NEAR( static_cast< double >( i_rBounds.Max[Axis] ), i_MinMax[2 * Axis + 1], i_Tolerance ) << Axis;
  }
}

} // namespace HostSources
