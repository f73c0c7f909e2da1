#include "RecordingInfoParts.h"

namespace HostSources::InfoParts
{

VRecordingInfo::VSkeleton DescribeSkeleton( const VRecordingSkeleton& i_rSkeleton )
{
  VRecordingInfo::VSkeleton Skeleton;
  Skeleton.Name = i_rSkeleton.Subject.Name;
  Skeleton.JointCount = i_rSkeleton.JointCount;
  Skeleton.EndSiteCount = i_rSkeleton.EndSiteCount;
  Skeleton.ChannelCount = i_rSkeleton.ChannelCount;
  Skeleton.StateSize = i_rSkeleton.StateSize;
  Skeleton.PoseCount = i_rSkeleton.StateSize > 0 ? i_rSkeleton.States.size() / i_rSkeleton.StateSize : 0;
  for ( const CoreMoxelTypes::VSegment& rSegment : i_rSkeleton.Subject.Segments )
  {
    Skeleton.Segments.push_back( rSegment.Name );
    Skeleton.BoneCount += rSegment.BoneLength > 0;
  }
  for ( const CoreMoxelTypes::VMarker& rMarker : i_rSkeleton.Subject.Markers )
  {
    Skeleton.Markers.push_back( rMarker.Name );
  }
  return Skeleton;
}

std::string SkeletonText( const VRecordingInfo::VSkeleton& i_rSkeleton )
{
  std::string Lines =
      std::string( "Skeleton:  " )
          .append( Shown( i_rSkeleton.Name ) )
          .append( Format( ", %llu joints, %llu bones, %llu end sites, %llu channels, %llu degrees of freedom, %zu "
                           "markers, %llu poses\n",
                           static_cast< unsigned long long >( i_rSkeleton.JointCount ),
                           static_cast< unsigned long long >( i_rSkeleton.BoneCount ),
                           static_cast< unsigned long long >( i_rSkeleton.EndSiteCount ),
                           static_cast< unsigned long long >( i_rSkeleton.ChannelCount ),
                           static_cast< unsigned long long >( i_rSkeleton.StateSize ), i_rSkeleton.Markers.size(),
                           static_cast< unsigned long long >( i_rSkeleton.PoseCount ) ) );
  for ( std::size_t Index = 0; Index < i_rSkeleton.Segments.size(); ++Index )
  {
    Lines.append( Index < i_rSkeleton.JointCount ? "  joint    " : "  bone     " )
        .append( Shown( i_rSkeleton.Segments[Index] ) )
        .append( "\n" );
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
    Texts( io_rWriter, "markers", rSkeleton.Markers );
    Integer( io_rWriter, "joints", static_cast< std::int64_t >( rSkeleton.JointCount ) );
    Integer( io_rWriter, "bones", static_cast< std::int64_t >( rSkeleton.BoneCount ) );
    Integer( io_rWriter, "poses", static_cast< std::int64_t >( rSkeleton.PoseCount ) );
    Integer( io_rWriter, "endSites", static_cast< std::int64_t >( rSkeleton.EndSiteCount ) );
    Integer( io_rWriter, "channels", static_cast< std::int64_t >( rSkeleton.ChannelCount ) );
    Integer( io_rWriter, "degreesOfFreedom", static_cast< std::int64_t >( rSkeleton.StateSize ) );
    io_rWriter.EndObject();
  }
  io_rWriter.EndArray();
}

VRecordingInfo::VSubject DescribeSubject( const CoreMoxelTypes::VSubject& i_rSubject )
{
  VRecordingInfo::VSubject Subject;
  Subject.Name = i_rSubject.Name;
  for ( const CoreMoxelTypes::VMarker& rMarker : i_rSubject.Markers )
  {
    Subject.Markers.push_back( rMarker.Name );
  }
  return Subject;
}

std::string SubjectText( const VRecordingInfo::VSubject& i_rSubject )
{
  return std::string( "Subject:   " )
      .append( Shown( i_rSubject.Name ) )
      .append( Format( ", %zu markers\n", i_rSubject.Markers.size() ) );
}

void WriteSubjects( VWriter& io_rWriter, const VRecordingInfo& i_rInfo )
{
  io_rWriter.Key( "subjects" );
  io_rWriter.StartArray();
  for ( const VRecordingInfo::VSubject& rSubject : i_rInfo.Subjects )
  {
    io_rWriter.StartObject();
    Text( io_rWriter, "name", rSubject.Name );
    Texts( io_rWriter, "markers", rSubject.Markers );
    io_rWriter.EndObject();
  }
  io_rWriter.EndArray();
}

} // namespace HostSources::InfoParts
