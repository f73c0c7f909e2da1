#include <HostSources/VC3dReader.h>

#include "C3dLayout.h"
#include "ForcePlates.h"
#include "Labels.h"
#include "ReaderSupport.h"
#include "UpAxis.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace HostSources
{
namespace C3d
{
namespace
{
/// The frames of one read: few enough to stay in the processor's cache, enough to make a read worth its call.
constexpr std::size_t BytesAtOnce = 512 * 1024;

/// How analog words become values.
struct VAnalogScale
{
  std::vector< float > Offset, Factor; ///< one a channel
  bool bUnsigned = false;              ///< integer words are 0 to 65535
};

VAnalogScale ReadAnalogScale( const VParameters& i_rParameters, const VLayout& i_rLayout )
{
  VAnalogScale Scale;
  const std::string Format = i_rParameters.Text( "ANALOG", "FORMAT" );
  Scale.bUnsigned = !i_rLayout.bFloat && SameName( Format, "UNSIGNED" );
  const double General = i_rParameters.Number( "ANALOG", "GEN_SCALE", 1 );
  const auto Factors = i_rParameters.Numbers( "ANALOG", "SCALE" );
  const auto Offsets = i_rParameters.Numbers( "ANALOG", "OFFSET", Scale.bUnsigned );
  for ( std::size_t Channel = 0; Channel < i_rLayout.Channels; ++Channel )
  {
    const double Factor = Channel < Factors.size() && std::isfinite( Factors[Channel] ) ? Factors[Channel] : 1;
    const double Offset = Channel < Offsets.size() && std::isfinite( Offsets[Channel] ) ? Offsets[Channel] : 0;
    Scale.Factor.push_back( static_cast< float >( Factor * General ) );
    Scale.Offset.push_back( static_cast< float >( Offset ) );
  }
  return Scale;
}

/// Turns four words a point into points; returns all camera masks joined. Negative fourth words mark gaps.
unsigned ConvertPoints( const float* i_pWords, std::size_t i_Count, float i_Factor, float i_ResidualFactor,
                        VRecordingPoint* o_pPoints, std::uint8_t* o_pMasks )
{
  constexpr float Nan = std::numeric_limits< float >::quiet_NaN();
  constexpr float Max = std::numeric_limits< float >::max();
  unsigned AllMasks = 0;
  for ( std::size_t Index = 0; Index < i_Count; ++Index )
  {
    const float* pWord = i_pWords + 4 * Index;
    const float x = pWord[0] * i_Factor, y = pWord[1] * i_Factor, z = pWord[2] * i_Factor;
    // NaN fails every comparison, so this one line sees gaps, NaN and infinity.
    const bool bValid = pWord[3] >= 0 && std::abs( x ) <= Max && std::abs( y ) <= Max && std::abs( z ) <= Max;
    const int Word = pWord[3] >= 0 && pWord[3] < 32768 ? static_cast< int >( pWord[3] ) : 0;
    o_pPoints[Index] = { bValid ? x : Nan, bValid ? y : Nan, bValid ? z : Nan,
                         bValid ? static_cast< float >( Word & 0xFF ) * i_ResidualFactor : Nan };
    const unsigned Mask = bValid ? static_cast< unsigned >( Word ) >> 8 : 0;
    o_pMasks[Index] = static_cast< std::uint8_t >( Mask );
    AllMasks |= Mask;
  }
  return AllMasks;
}

void ConvertAnalog( const float* i_pWords, std::size_t i_Samples, const VAnalogScale& i_rScale, float* o_pValues )
{
  const std::size_t Channels = i_rScale.Factor.size();
  const float* pOffset = i_rScale.Offset.data();
  const float* pFactor = i_rScale.Factor.data();
  const float Wrap = i_rScale.bUnsigned ? 65536.0f : 0.0f;
  for ( std::size_t Sample = 0; Sample < i_Samples; ++Sample, i_pWords += Channels, o_pValues += Channels )
  {
    for ( std::size_t Channel = 0; Channel < Channels; ++Channel )
    {
      const float Word = i_pWords[Channel] + ( i_pWords[Channel] < 0 ? Wrap : 0.0f );
      o_pValues[Channel] = ( Word - pOffset[Channel] ) * pFactor[Channel];
    }
  }
}

/// Reads the frames a piece at a time, each turned into numbers while it lies in the processor's cache.
class VFrameReader
{
public:
  VFrameReader( const VLayout& i_rLayout, const VAnalogScale& i_rScale, VRecording& io_rRecording )
    : m_rLayout( i_rLayout )
    , m_rScale( i_rScale )
    , m_rRecording( io_rRecording )
  {
    const auto Frames = static_cast< std::size_t >( i_rLayout.FrameCount );
    io_rRecording.Points.reserve( Frames * i_rLayout.Points );
    io_rRecording.CameraMasks.reserve( Frames * i_rLayout.Points );
    io_rRecording.Analog.reserve( Frames * i_rLayout.Channels * i_rLayout.PerFrame );
  }

  ZEK::IResult Read( IByteSource& io_rSource, const VProgress& i_rProgress, std::string& o_rMessage )
  {
    const std::size_t FrameBytes = m_rLayout.FrameBytes();
    const auto AtOnce = static_cast< std::int64_t >( std::max< std::size_t >( BytesAtOnce / FrameBytes, 1 ) );
    m_Words.resize( static_cast< std::size_t >( std::min( AtOnce, m_rLayout.FrameCount ) ) * m_rLayout.FrameWords() );
    for ( std::int64_t Frame = 0; Frame < m_rLayout.FrameCount; Frame += AtOnce )
    {
      if ( i_rProgress &&
           !i_rProgress( static_cast< double >( Frame ) / static_cast< double >( m_rLayout.FrameCount ) ) )
      {
        o_rMessage = "the reading was stopped";
        return ZEK::IResult::Canceled;
      }
      const auto Frames = static_cast< std::size_t >( std::min( AtOnce, m_rLayout.FrameCount - Frame ) );
      const std::uint64_t Offset = m_rLayout.DataOffset + static_cast< std::uint64_t >( Frame ) * FrameBytes;
      const auto Bytes = io_rSource.Read( Offset, Frames * FrameBytes );
      if ( Bytes.size() < Frames * FrameBytes )
      {
        o_rMessage = "byte offset " + std::to_string( Offset + Bytes.size() ) + ": expected " +
                     std::to_string( Frames * FrameBytes - Bytes.size() ) + " more bytes, and they could not be read";
        return ZEK::IResult::FileIOFailure;
      }
      Take( Bytes.data(), Frames );
    }
    if ( m_AllMasks == 0 )
    {
      m_rRecording.CameraMasks = {};
    }
    return ZEK::IResult::Ok;
  }

private:
  void Take( const std::byte* i_pBytes, std::size_t i_Frames )
  {
    LoadWords( m_rLayout.Form, m_rLayout.bFloat, i_pBytes, i_Frames * m_rLayout.FrameWords(), m_Words.data() );
    const double Residual = m_rLayout.Scale * m_rRecording.UnitScale;
    const auto Factor =
        static_cast< float >( m_rLayout.bFloat ? m_rRecording.UnitScale : m_rLayout.Scale * m_rRecording.UnitScale );
    const std::size_t Analog = m_rLayout.Channels * m_rLayout.PerFrame;
    const std::size_t PointsDone = m_rRecording.Points.size(), AnalogDone = m_rRecording.Analog.size();
    m_rRecording.Points.resize( PointsDone + i_Frames * m_rLayout.Points );
    m_rRecording.CameraMasks.resize( PointsDone + i_Frames * m_rLayout.Points );
    m_rRecording.Analog.resize( AnalogDone + i_Frames * Analog );
    for ( std::size_t Frame = 0; Frame < i_Frames; ++Frame )
    {
      const float* pWords = m_Words.data() + Frame * m_rLayout.FrameWords();
      const std::size_t Point = PointsDone + Frame * m_rLayout.Points;
      m_AllMasks |= ConvertPoints( pWords, m_rLayout.Points, Factor, static_cast< float >( Residual ),
                                   m_rRecording.Points.data() + Point, m_rRecording.CameraMasks.data() + Point );
      ConvertAnalog( pWords + 4 * m_rLayout.Points, m_rLayout.PerFrame, m_rScale,
                     m_rRecording.Analog.data() + AnalogDone + Frame * Analog );
    }
    const std::span< const VRecordingPoint > New( m_rRecording.Points.data() + PointsDone,
                                                  i_Frames * m_rLayout.Points );
    AddToBounds( m_rRecording.Bounds, New );
    std::uint64_t Gaps = 0;
    for ( const VRecordingPoint& rPoint : New )
    {
      Gaps += rPoint.IsValid() ? 0u : 1u;
    }
    m_rRecording.GapCount += Gaps;
  }

  const VLayout& m_rLayout;
  const VAnalogScale& m_rScale;
  VRecording& m_rRecording;
  std::vector< float > m_Words;
  unsigned m_AllMasks = 0;
};

void ReadLabels( const VParameters& i_rParameters, std::size_t i_Points, VRecording& io_rRecording )
{
  io_rRecording.FileLabels = i_rParameters.Texts( "POINT", "LABELS" );
  io_rRecording.FileLabels.resize( i_Points );
  io_rRecording.Descriptions = i_rParameters.Texts( "POINT", "DESCRIPTIONS" );
  io_rRecording.Descriptions.resize( i_Points );
  io_rRecording.Labels = io_rRecording.FileLabels;
  for ( std::string& rLabel : io_rRecording.Labels )
  {
    // "*12" is how recorders name a trajectory that nobody has named.
    if ( rLabel.size() > 1 && rLabel[0] == '*' && rLabel.find_first_not_of( "0123456789", 1 ) == std::string::npos )
    {
      rLabel.clear();
    }
  }
  const std::size_t Changed = MakeLabelsUnique( io_rRecording.Labels, io_rRecording.Descriptions );
  if ( Changed > 0 )
  {
    io_rRecording.Notes.push_back( std::to_string( Changed ) +
                                   " labels repeat; they were replaced by their descriptions or numbered." );
  }
}

void ReadAnalogChannels( const VParameters& i_rParameters, const VLayout& i_rLayout, VRecording& io_rRecording )
{
  const auto Names = i_rParameters.Texts( "ANALOG", "LABELS" );
  const auto Descriptions = i_rParameters.Texts( "ANALOG", "DESCRIPTIONS" );
  const auto Units = i_rParameters.Texts( "ANALOG", "UNITS" );
  const auto At = []( const std::vector< std::string >& i_rTexts, std::size_t i_Index )
  {
    return i_Index < i_rTexts.size() ? i_rTexts[i_Index] : std::string();
  };
  io_rRecording.AnalogPerFrame = static_cast< std::uint32_t >( i_rLayout.Channels > 0 ? i_rLayout.PerFrame : 0 );
  for ( std::size_t Index = 0; Index < i_rLayout.Channels; ++Index )
  {
    io_rRecording.AnalogChannels.push_back( { At( Names, Index ), At( Descriptions, Index ), At( Units, Index ) } );
  }
}

void AddEvent( const std::string& i_rLabel, const std::string& i_rContext, double i_Seconds, VRecording& io_rRecording )
{
  if ( std::isfinite( i_Seconds ) )
  {
    const double Before = static_cast< double >( io_rRecording.FirstFrame - 1 ) / io_rRecording.RateHz;
    io_rRecording.Events.push_back( { i_rLabel, i_rContext, i_Seconds, i_Seconds - Before } );
  }
}

/// Up to 18 events stand in the header of files that have no EVENT group.
void ReadHeaderEvents( const VHeader& i_rHeader, VRecording& io_rRecording )
{
  constexpr std::uint16_t FourLetterKey = 12345;
  if ( i_rHeader.Word( 150 ) != FourLetterKey )
  {
    return;
  }
  const std::size_t Count = std::min< std::size_t >( i_rHeader.Word( 151 ), 18 );
  for ( std::size_t Index = 0; Index < Count; ++Index )
  {
    const auto* pLabel = reinterpret_cast< const char* >( i_rHeader.Bytes.data() ) + 2 * 198 + 4 * Index;
    std::string Label( pLabel, 4 );
    Label.resize( Label.find_last_not_of( std::string_view( " \0", 2 ) ) + 1 );
    AddEvent( ToUtf8( Label ), {}, static_cast< double >( i_rHeader.Float( 153 + 2 * Index ) ), io_rRecording );
  }
}

void ReadEvents( const VHeader& i_rHeader, const VParameters& i_rParameters, VRecording& io_rRecording )
{
  const auto Times = i_rParameters.Numbers( "EVENT", "TIMES" );
  if ( Times.empty() )
  {
    return ReadHeaderEvents( i_rHeader, io_rRecording );
  }
  const auto Labels = i_rParameters.Texts( "EVENT", "LABELS" );
  const auto Contexts = i_rParameters.Texts( "EVENT", "CONTEXTS" );
  const std::size_t Count = std::min( i_rParameters.Count( "EVENT", "USED", Times.size() / 2 ), Times.size() / 2 );
  for ( std::size_t Index = 0; Index < Count; ++Index )
  {
    AddEvent( Index < Labels.size() ? Labels[Index] : std::string(),
              Index < Contexts.size() ? Contexts[Index] : std::string(), Times[2 * Index] * 60 + Times[2 * Index + 1],
              io_rRecording );
  }
  std::stable_sort( io_rRecording.Events.begin(), io_rRecording.Events.end(),
                    []( const VRecordingEvent& i_rA, const VRecordingEvent& i_rB )
                    {
                      return i_rA.Seconds < i_rB.Seconds;
                    } );
}

void ReadRateAndUnit( const VHeader& i_rHeader, const VParameters& i_rParameters, VRecording& io_rRecording )
{
  const double Rate = i_rParameters.Number( "POINT", "RATE", 0 );
  TakeRate( IsUsableRate( Rate ) ? Rate : static_cast< double >( i_rHeader.Float( 11 ) ), io_rRecording );
  // A name stands once, or once for each point.
  TakeUnit( i_rParameters.Text( "POINT", "UNITS" ), io_rRecording );
}

ZEK::IResult Read( IByteSource& io_rSource, VRecording& io_rRecording, std::string& o_rMessage,
                   const VProgress& i_rProgress )
{
  VHeader Header;
  VParameters Parameters;
  VLayout Layout;
  ZEK::IResult Result = ReadLayout( io_rSource, Header, Parameters, Layout, io_rRecording, o_rMessage );
  if ( Result.IsError() )
  {
    return Result;
  }
  io_rRecording.Form = std::string( Layout.bFloat ? "float, " : "integer, " ) + FormName( Layout.Form );
  io_rRecording.FirstFrame = Layout.FirstFrame;
  io_rRecording.FrameCount = Layout.FrameCount;
  ReadRateAndUnit( Header, Parameters, io_rRecording );
  ReadLabels( Parameters, Layout.Points, io_rRecording );
  ReadAnalogChannels( Parameters, Layout, io_rRecording );
  const VAnalogScale Scale = ReadAnalogScale( Parameters, Layout );
  Result = VFrameReader( Layout, Scale, io_rRecording ).Read( io_rSource, i_rProgress, o_rMessage );
  if ( Result.IsError() )
  {
    return Result;
  }
  ChooseUpAxisByScreen( io_rRecording, Parameters.Text( "POINT", "X_SCREEN" ), Parameters.Text( "POINT", "Y_SCREEN" ) );
  ReadForcePlates( Parameters, io_rRecording );
  ReadEvents( Header, Parameters, io_rRecording );
  if ( Layout.FrameCount < Layout.Promised )
  {
    o_rMessage = "byte offset " + std::to_string( io_rSource.Size() ) + ": expected " +
                 std::to_string( Layout.Promised ) + " frames of " + std::to_string( Layout.FrameBytes() ) +
                 " bytes, found the end of the file; the " + std::to_string( Layout.FrameCount ) +
                 " whole frames before it were read";
    io_rRecording.Notes.push_back( "The file is cut off: " + o_rMessage + "." );
    return ZEK::IResult::OkButPartial;
  }
  return ZEK::IResult::Ok;
}
} // namespace
} // namespace C3d

bool LooksLikeC3d( std::span< const std::byte > i_Bytes )
{
  return i_Bytes.size() >= 2 && i_Bytes[1] == std::byte{ 0x50 } && i_Bytes[0] != std::byte{ 0 };
}

ZEK::IResult ReadC3d( IByteSource& io_rSource, const std::string& i_rName, VRecording& o_rRecording,
                      std::string& o_rMessage, const VProgress& i_rProgress )
{
  return ReadGuarded( ERecordingFormat::C3d, i_rName, o_rRecording, o_rMessage,
                      [&]
                      {
                        return C3d::Read( io_rSource, o_rRecording, o_rMessage, i_rProgress );
                      } );
}

ZEK::IResult ReadC3d( std::span< const std::byte > i_Bytes, const std::string& i_rName, VRecording& o_rRecording,
                      std::string& o_rMessage, const VProgress& i_rProgress )
{
  VMemorySource Source( i_Bytes );
  return ReadC3d( Source, i_rName, o_rRecording, o_rMessage, i_rProgress );
}

} // namespace HostSources
