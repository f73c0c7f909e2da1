#include <HostSources/ReadRecording.h>

#include <HostSources/VBvhReader.h>
#include <HostSources/VC3dReader.h>
#include <HostSources/VFolderReader.h>
#include <HostSources/VTrcReader.h>

#include "ReaderSupport.h"

#include <algorithm>
#include <cctype>

namespace HostSources
{
namespace
{
bool HasSuffix( const std::filesystem::path& i_rPath, const char* i_pSuffix )
{
  std::string Suffix = i_rPath.extension().string();
  std::transform( Suffix.begin(), Suffix.end(), Suffix.begin(),
                  []( unsigned char i_Character )
                  {
                    return static_cast< char >( std::tolower( i_Character ) );
                  } );
  return Suffix == i_pSuffix;
}

/// A text is read as a whole before its lines are.
template < typename TRead >
ZEK::IResult ReadTextFile( ERecordingFormat i_Format, TRead&& i_rRead, VFileSource& io_rSource,
                           const std::string& i_rName, VRecording& o_rRecording, std::string& o_rMessage,
                           const VProgress& i_rProgress )
{
  std::span< const std::byte > Bytes;
  const ZEK::IResult Loaded = ReadGuarded( i_Format, i_rName, o_rRecording, o_rMessage,
                                           [&]
                                           {
                                             if ( i_rProgress && !i_rProgress( 0 ) )
                                             {
                                               o_rMessage = "the reading was stopped";
                                               return ZEK::IResult( ZEK::IResult::Canceled );
                                             }
                                             const auto Size = static_cast< std::size_t >( io_rSource.Size() );
                                             Bytes = io_rSource.Read( 0, Size );
                                             if ( Bytes.size() < Size )
                                             {
                                               o_rMessage = "byte offset " + std::to_string( Bytes.size() ) +
                                                            ": expected " + std::to_string( Size ) +
                                                            " bytes, and they could not be read";
                                               return ZEK::IResult( ZEK::IResult::FileIOFailure );
                                             }
                                             return ZEK::IResult();
                                           } );
  return Loaded.IsOk() ? i_rRead( Bytes, i_rName, o_rRecording, o_rMessage, i_rProgress ) : Loaded;
}
} // namespace

ZEK::IResult ReadRecording( const std::filesystem::path& i_rPath, VRecording& o_rRecording, std::string& o_rMessage,
                            const VProgress& i_rProgress, const VFolderOptions& i_rFolder )
{
  o_rRecording = {};
  o_rMessage.clear();
  std::error_code Ignored;
  if ( std::filesystem::is_directory( i_rPath, Ignored ) )
  {
    return ReadFolder( i_rPath, o_rRecording, o_rMessage, i_rProgress, i_rFolder );
  }
  VFileSource Source;
  const ZEK::IResult Opened = Source.Open( i_rPath, o_rMessage );
  if ( Opened.IsError() )
  {
    return Opened;
  }
  const std::string Name = i_rPath.string();
  if ( Source.Size() == 0 )
  {
    o_rMessage = Name + ": byte offset 0: expected a C3D, TRC or BVH recording, found an empty file";
    return ZEK::IResult::EndOfData;
  }
  const auto Head = Source.Read( 0, 64 );
  if ( Head.empty() )
  {
    o_rMessage = Name + ": byte offset 0: expected a C3D, TRC or BVH recording, and the file could not be read";
    return ZEK::IResult::FileIOFailure;
  }
  const bool bC3d = LooksLikeC3d( Head ), bTrc = LooksLikeTrc( Head );
  // With damaged first bytes the reader of the file's suffix can still say best what is wrong.
  if ( bTrc || ( !bC3d && HasSuffix( i_rPath, ".trc" ) ) )
  {
    return ReadTextFile( ERecordingFormat::Trc, ReadTrc, Source, Name, o_rRecording, o_rMessage, i_rProgress );
  }
  if ( LooksLikeBvh( Head ) || ( !bC3d && HasSuffix( i_rPath, ".bvh" ) ) )
  {
    return ReadTextFile( ERecordingFormat::Bvh, ReadBvh, Source, Name, o_rRecording, o_rMessage, i_rProgress );
  }
  if ( bC3d || HasSuffix( i_rPath, ".c3d" ) )
  {
    return ReadC3d( Source, Name, o_rRecording, o_rMessage, i_rProgress );
  }
  o_rMessage = Name + ": byte offset 0: expected a C3D file (0x50 at byte offset 1), a TRC file (\"PathFileType\" " +
               "in line 1) or a BVH file (\"HIERARCHY\" in line 1), found none of them";
  return ZEK::IResult::InvalidFormat;
}

} // namespace HostSources
