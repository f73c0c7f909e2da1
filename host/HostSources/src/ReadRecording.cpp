#include <HostSources/ReadRecording.h>

#include <HostSources/VBvhReader.h>
#include <HostSources/VC3dReader.h>
#include <HostSources/VFolderReader.h>
#include <HostSources/VMotionReader.h>
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

/// With the model that the file moves.
ZEK::IResult ReadMotionFile( VFileSource& io_rSource, const std::filesystem::path& i_rPath,
                             const std::filesystem::path& i_rModel, VRecording& o_rRecording, std::string& o_rMessage,
                             const VProgress& i_rProgress )
{
  std::filesystem::path Model;
  ZEK::IResult Result = FindModel( i_rPath, i_rModel, Model, o_rMessage );
  VFileSource ModelSource;
  Result = Result.IsOk() ? ModelSource.Open( Model, o_rMessage, "a model (.osim)" ) : Result;
  if ( Result.IsError() )
  {
    return Result;
  }
  const auto Read = [&]( std::span< const std::byte > i_Motion, const std::string& i_rName, VRecording& o_rRead,
                         std::string& o_rReadMessage, const VProgress& i_rReadProgress )
  {
    return ReadTextFile(
        ERecordingFormat::Motion,
        [&]( std::span< const std::byte > i_Model, const std::string&, VRecording& o_rInner,
             std::string& o_rInnerMessage, const VProgress& i_rInnerProgress )
        {
          return ReadMotion( i_Motion, i_rName, i_Model, Model.filename().string(), o_rInner, o_rInnerMessage,
                             i_rInnerProgress );
        },
        ModelSource, Model.string(), o_rRead, o_rReadMessage, i_rReadProgress );
  };
  return ReadTextFile( ERecordingFormat::Motion, Read, io_rSource, i_rPath.string(), o_rRecording, o_rMessage,
                       i_rProgress );
}
} // namespace

ZEK::IResult ReadRecording( const std::filesystem::path& i_rPath, VRecording& o_rRecording, std::string& o_rMessage,
                            const VProgress& i_rProgress, const VReadOptions& i_rOptions )
{
  o_rRecording = {};
  o_rMessage.clear();
  std::error_code Ignored;
  if ( std::filesystem::is_directory( i_rPath, Ignored ) )
  {
    return ReadFolder( i_rPath, o_rRecording, o_rMessage, i_rProgress, i_rOptions );
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
    o_rMessage = Name + ": byte offset 0: expected a C3D, TRC, BVH or MOT recording, found an empty file";
    return ZEK::IResult::EndOfData;
  }
  const auto Head = Source.Read( 0, 64 );
  if ( Head.empty() )
  {
    o_rMessage = Name + ": byte offset 0: expected a C3D, TRC, BVH or MOT recording, and the file could not be read";
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
  if ( LooksLikeMotion( Source.Read( 0, 4096 ) ) || HasSuffix( i_rPath, ".mot" ) || HasSuffix( i_rPath, ".sto" ) )
  {
    return ReadMotionFile( Source, i_rPath, i_rOptions.Model, o_rRecording, o_rMessage, i_rProgress );
  }
  if ( HasSuffix( i_rPath, ".osim" ) )
  {
    o_rMessage = Name + ": expected a recording, found a model; open the motion file (.mot) that moves it";
    return ZEK::IResult::InvalidFormat;
  }
  o_rMessage = Name + ": byte offset 0: expected a C3D file (0x50 at byte offset 1), a TRC file (\"PathFileType\" " +
               "in line 1), a BVH file (\"HIERARCHY\" in line 1) or a MOT file (with a line \"endheader\"), found " +
               "none of them";
  return ZEK::IResult::InvalidFormat;
}

} // namespace HostSources
