#include "RecordingInfoParts.h"

namespace HostSources::InfoParts
{

VRecordingInfo::VSkeleton DescribeSkeleton( const VRecordingSkeleton& i_rSkeleton )
{
  VRecordingInfo::VSkeleton Skeleton{
      i_rSkeleton.Subject.Name, {}, i_rSkeleton.EndSiteCount, i_rSkeleton.ChannelCount, i_rSkeleton.StateSize };
  for ( const CoreMoxelTypes::VSegment& rSegment : i_rSkeleton.Subject.Segments )
  {
    Skeleton.Segments.push_back( rSegment.Name );
  }
  return Skeleton;
}

std::string SkeletonText( const VRecordingInfo::VSkeleton& i_rSkeleton )
{
  std::string Lines =
      std::string( "Skeleton:  " )
          .append( Shown( i_rSkeleton.Name ) )
          .append( Format( ", %zu joints, %llu end sites, %llu channels, %llu degrees of freedom\n",
                           i_rSkeleton.Segments.size(), static_cast< unsigned long long >( i_rSkeleton.EndSiteCount ),
                           static_cast< unsigned long long >( i_rSkeleton.ChannelCount ),
                           static_cast< unsigned long long >( i_rSkeleton.StateSize ) ) );
  for ( const std::string& rName : i_rSkeleton.Segments )
  {
    Lines.append( "  joint    " ).append( Shown( rName ) ).append( "\n" );
  }
  return Lines;
}

void WriteSkeletons( VWriter& io_rWriter, const VRecordingInfo& i_rInfo )
{
  io_rWriter.Key( "skeletons" );
  io_rWriter.StartArray();
  for ( const VRecordingInfo::VSkeleton& rSkeleton : i_rInfo.Skeletons )
  {
    io_rWriter.StartObject();
    Text( io_rWriter, "name", rSkeleton.Name );
    Texts( io_rWriter, "segments", rSkeleton.Segments );
    Integer( io_rWriter, "endSites", static_cast< std::int64_t >( rSkeleton.EndSiteCount ) );
    Integer( io_rWriter, "channels", static_cast< std::int64_t >( rSkeleton.ChannelCount ) );
    Integer( io_rWriter, "degreesOfFreedom", static_cast< std::int64_t >( rSkeleton.StateSize ) );
    io_rWriter.EndObject();
  }
  io_rWriter.EndArray();
}

} // namespace HostSources::InfoParts
