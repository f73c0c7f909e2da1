#include "C3dLayout.h"

#include <HostSources/VC3dReader.h>

#include <algorithm>
#include <cmath>

namespace HostSources::C3d
{
namespace
{
constexpr std::uint64_t BlockSize = 512;

std::string At( std::uint64_t i_Offset )
{
  return "byte offset " + std::to_string( i_Offset ) + ": ";
}

ZEK::IResult ReadHeader( IByteSource& io_rSource, VHeader& o_rHeader, std::string& o_rMessage )
{
  const auto Bytes = io_rSource.Read( 0, BlockSize );
  if ( !LooksLikeC3d( Bytes ) )
  {
    o_rMessage = Bytes.empty()
                     ? At( 0 ) + "expected a C3D file, found no bytes"
                     : At( 0 ) + "expected the number of the first parameter block and 0x50, the mark of a C3D file";
    return Bytes.empty() ? ZEK::IResult::EndOfData : ZEK::IResult::InvalidFormat;
  }
  if ( Bytes.size() < BlockSize )
  {
    o_rMessage = At( Bytes.size() ) + "expected a header of 512 bytes, found the end of the file";
    return ZEK::IResult::EndOfData;
  }
  std::copy( Bytes.begin(), Bytes.end(), o_rHeader.Bytes.begin() );
  return ZEK::IResult::Ok;
}

/// The section ends where the data begin, or, where the header does not say, after its own number of blocks.
ZEK::IResult ReadParameters( IByteSource& io_rSource, VHeader& io_rHeader, VParameters& o_rParameters,
                             VRecording& io_rRecording, std::string& o_rMessage )
{
  const std::uint64_t Start = ( std::to_integer< std::uint64_t >( io_rHeader.Bytes[0] ) - 1 ) * BlockSize;
  const auto Head = io_rSource.Read( Start, 4 );
  if ( Head.size() < 4 )
  {
    o_rMessage = At( Start ) + "expected the parameters, found the end of the file";
    return ZEK::IResult::EndOfData;
  }
  const unsigned Processor = std::to_integer< unsigned >( Head[3] );
  const std::uint64_t Blocks = std::max< std::uint64_t >( std::to_integer< std::uint64_t >( Head[2] ), 1 );
  if ( Processor < 84 || Processor > 86 )
  {
    o_rMessage = At( Start + 3 ) + "expected the processor type 84 (Intel), 85 (DEC) or 86 (MIPS), found " +
                 std::to_string( Processor );
    return ZEK::IResult::InvalidFormat;
  }
  io_rHeader.Form = static_cast< EForm >( Processor );
  const std::uint64_t Data = io_rHeader.Word( 9 ) == 0 ? 0 : ( io_rHeader.Word( 9 ) - 1u ) * BlockSize;
  const std::uint64_t End = Data > Start ? Data : Start + Blocks * BlockSize;
  const std::uint64_t First = Start + 4;
  const auto Section = io_rSource.Read( First, static_cast< std::size_t >( End - First ) );
  if ( Section.empty() )
  {
    o_rMessage = At( First ) + "expected the parameters, found the end of the file";
    return ZEK::IResult::EndOfData;
  }
  o_rParameters.Parse( io_rHeader.Form, { Section.begin(), Section.end() }, First, io_rRecording.Notes );
  return ZEK::IResult::Ok;
}

void FindCounts( const VHeader& i_rHeader, const VParameters& i_rParameters, VLayout& io_rLayout,
                 std::vector< std::string >& io_rNotes )
{
  const std::size_t HeaderPoints = i_rHeader.Word( 2 );
  const std::size_t HeaderWords = i_rHeader.Word( 3 );
  io_rLayout.Points = i_rParameters.Count( "POINT", "USED", HeaderPoints );
  if ( io_rLayout.Points != HeaderPoints )
  {
    io_rNotes.push_back( "The header promises " + std::to_string( HeaderPoints ) + " points, POINT:USED " +
                         std::to_string( io_rLayout.Points ) + "; the latter was taken." );
  }
  io_rLayout.PerFrame = std::max< std::size_t >( i_rHeader.Word( 10 ), HeaderWords > 0 ? 1 : 0 );
  const std::size_t Used =
      i_rParameters.Count( "ANALOG", "USED", io_rLayout.PerFrame > 0 ? HeaderWords / io_rLayout.PerFrame : 0 );
  io_rLayout.Channels = Used;
  if ( Used * io_rLayout.PerFrame == HeaderWords )
  {
    return;
  }
  if ( Used > 0 && HeaderWords % Used == 0 )
  {
    io_rLayout.PerFrame = HeaderWords / Used;
  }
  else
  {
    io_rLayout.Channels = HeaderWords / std::max< std::size_t >( io_rLayout.PerFrame, 1 );
    io_rLayout.PerFrame = io_rLayout.Channels > 0 ? io_rLayout.PerFrame : 0;
  }
  io_rNotes.push_back( "The header promises " + std::to_string( HeaderWords ) + " analog values a frame, ANALOG:USED " +
                       std::to_string( Used ) + " channels; " + std::to_string( io_rLayout.Channels ) +
                       " channels with " + std::to_string( io_rLayout.PerFrame ) + " samples a frame were taken." );
}

ZEK::IResult FindScale( const VHeader& i_rHeader, const VParameters& i_rParameters, VLayout& io_rLayout,
                        std::string& o_rMessage )
{
  const double Scale = i_rParameters.Number( "POINT", "SCALE", static_cast< double >( i_rHeader.Float( 7 ) ) );
  if ( !std::isfinite( Scale ) || ( Scale == 0 && io_rLayout.Points > 0 ) )
  {
    o_rMessage = At( 12 ) + "expected the scale of the points, a number other than 0, found " +
                 ( std::isfinite( Scale ) ? "0" : "none" );
    return ZEK::IResult::InvalidFormat;
  }
  io_rLayout.bFloat = Scale < 0;
  io_rLayout.Scale = std::abs( Scale );
  return ZEK::IResult::Ok;
}

/// A frame number too large for one word stands in two, the low one first, or in one float.
std::int64_t LongField( const VParameters& i_rParameters, const char* i_pName )
{
  const VParameters::VParameter* pField = i_rParameters.Find( "TRIAL", i_pName );
  if ( !pField || pField->Count() == 0 )
  {
    return -1;
  }
  const double Low = i_rParameters.Number( *pField, 0, true );
  const double High = pField->Type == 2 && pField->Count() > 1 ? i_rParameters.Number( *pField, 1, true ) : 0;
  return Low >= 0 && Low < 4e9 ? static_cast< std::int64_t >( Low + High * 65536 ) : -1;
}

std::int64_t LongCount( const VParameters& i_rParameters, const char* i_pName )
{
  const double Count = i_rParameters.Number( "POINT", i_pName, 0, 0, true );
  return Count >= 1 && Count < 4e9 ? static_cast< std::int64_t >( Count ) : 0;
}

/// The header has 16 bits for a frame number; longer trials say their length in one of several places, or nowhere.
void FindFrames( const VHeader& i_rHeader, const VParameters& i_rParameters, std::int64_t i_Capacity,
                 VLayout& io_rLayout, std::vector< std::string >& io_rNotes )
{
  const std::int64_t First = i_rHeader.Word( 4 ), Last = i_rHeader.Word( 5 );
  const std::int64_t InHeader = Last >= First ? Last - First + 1 : 0;
  const std::int64_t Begin = LongField( i_rParameters, "ACTUAL_START_FIELD" );
  const std::int64_t End = LongField( i_rParameters, "ACTUAL_END_FIELD" );
  const std::int64_t InTrial = Begin >= 0 && End >= Begin ? End - Begin + 1 : 0;
  const std::int64_t InPoint =
      std::max( LongCount( i_rParameters, "LONG_FRAMES" ), LongCount( i_rParameters, "FRAMES" ) );
  const bool bFull = Last == 65535 || InHeader == 0;

  io_rLayout.FirstFrame = First;
  io_rLayout.Promised = InHeader;
  const bool bWrapped = ( InTrial & 0xFFFF ) == ( InHeader & 0xFFFF );
  if ( InTrial > 0 && ( bFull || bWrapped || ( InTrial > InHeader && InTrial <= i_Capacity ) ) )
  {
    io_rLayout.FirstFrame = Begin;
    io_rLayout.Promised = InTrial;
  }
  else if ( InPoint > InHeader && ( bFull || InPoint <= i_Capacity ) )
  {
    io_rLayout.Promised = InPoint;
  }
  else if ( bFull && InHeader > 0 && i_Capacity > InHeader &&
            static_cast< std::uint64_t >( i_Capacity - InHeader ) * io_rLayout.FrameBytes() >= BlockSize )
  {
    io_rLayout.Promised = i_Capacity;
    io_rNotes.push_back( "The header's frame number is at its limit and no parameter gives a longer one: " +
                         std::to_string( i_Capacity ) + " frames were counted by the size of the file." );
  }
  if ( io_rLayout.Promised != InHeader && InHeader > 0 && !bFull && !bWrapped )
  {
    io_rNotes.push_back( "The header promises " + std::to_string( InHeader ) + " frames, the parameters " +
                         std::to_string( io_rLayout.Promised ) + "; the latter was taken." );
  }
}
} // namespace

ZEK::IResult ReadLayout( IByteSource& io_rSource, VHeader& o_rHeader, VParameters& o_rParameters, VLayout& o_rLayout,
                         VRecording& io_rRecording, std::string& o_rMessage )
{
  ZEK::IResult Result = ReadHeader( io_rSource, o_rHeader, o_rMessage );
  if ( Result.IsOk() )
  {
    Result = ReadParameters( io_rSource, o_rHeader, o_rParameters, io_rRecording, o_rMessage );
  }
  if ( Result.IsError() )
  {
    return Result;
  }
  o_rLayout.Form = o_rHeader.Form;
  FindCounts( o_rHeader, o_rParameters, o_rLayout, io_rRecording.Notes );
  Result = FindScale( o_rHeader, o_rParameters, o_rLayout, o_rMessage );
  if ( Result.IsError() )
  {
    return Result;
  }
  if ( o_rLayout.FrameWords() == 0 )
  {
    o_rMessage = At( 2 ) + "expected points or analog channels, found neither";
    return ZEK::IResult::InvalidFormat;
  }
  std::uint64_t Block = o_rHeader.Word( 9 );
  if ( Block < 2 )
  {
    Block = o_rParameters.Count( "POINT", "DATA_START", 0 );
  }
  if ( Block < 2 )
  {
    o_rMessage =
        At( 16 ) + "expected the number of the first data block, found " + std::to_string( o_rHeader.Word( 9 ) );
    return ZEK::IResult::InvalidFormat;
  }
  o_rLayout.DataOffset = ( Block - 1 ) * BlockSize;
  const std::uint64_t Size = io_rSource.Size();
  const std::uint64_t Available = Size > o_rLayout.DataOffset ? Size - o_rLayout.DataOffset : 0;
  const auto Capacity = static_cast< std::int64_t >( Available / o_rLayout.FrameBytes() );
  FindFrames( o_rHeader, o_rParameters, Capacity, o_rLayout, io_rRecording.Notes );
  o_rLayout.FrameCount = std::min( o_rLayout.Promised, Capacity );
  if ( o_rLayout.FrameCount <= 0 )
  {
    o_rMessage = At( std::min( o_rLayout.DataOffset, Size ) ) + "expected frames of " +
                 std::to_string( o_rLayout.FrameBytes() ) + " bytes, " + std::to_string( o_rLayout.Promised ) +
                 " of them, found " + std::to_string( Available ) + " bytes";
    return ZEK::IResult::EndOfData;
  }
  return ZEK::IResult::Ok;
}

} // namespace HostSources::C3d
