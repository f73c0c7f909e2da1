#include <ComputeSubjectFK/VComputeSubjectFK.h>

namespace ComputeSubject
{
namespace
{
EJointType JointTypeOf( CoreMoxelTypes::EJointType i_Type )
{
  // The numbers are the same; those beyond are no joint.
  const auto Number = static_cast< std::uint32_t >( i_Type );
  return Number < static_cast< std::uint32_t >( EJointType::BadJointType ) ? EJointType{ Number }
                                                                           : EJointType::BadJointType;
}

std::string Named( const char* i_pKind, std::size_t i_Index, const std::string& i_rName )
{
  return std::string( i_pKind ).append( std::to_string( i_Index ) ).append( " \"" ).append( i_rName ).append( "\": " );
}

/// Does `i_rWork` and lets a failure say which part of the subject it is about.
template < typename TWork >
void Telling( const char* i_pKind, std::size_t i_Index, const std::string& i_rName, TWork&& i_rWork )
{
  try
  {
    i_rWork();
  }
  catch ( const VConstructionException& rFailure )
  {
    throw VConstructionException( Named( i_pKind, i_Index, i_rName ).append( rFailure.what() ), rFailure.Code() );
  }
}

void AddSegmentOf( VComputeSubjectFK& io_rSubject, const CoreMoxelTypes::VSegment& i_rSegment )
{
  std::size_t Parent = VComputeSubjectFK::NoParent;
  if ( i_rSegment.Parent != -1 )
  {
    if ( i_rSegment.Parent < 0 )
    {
      throw VConstructionException( "The parent's index is negative.", ZEK::IResult::InvalidIndex );
    }
    Parent = static_cast< std::size_t >( i_rSegment.Parent );
  }
  io_rSubject.AddSegment( Parent, { JointTypeOf( i_rSegment.Joint ), VRigidTransform::From( i_rSegment.Pre ),
                                    VRigidTransform::From( i_rSegment.Post ) } );
}

void AddTargetOf( VComputeSubjectFK& io_rSubject, const CoreMoxelTypes::VMarker& i_rMarker, std::size_t i_Index )
{
  if ( i_rMarker.Segment < -1 )
  {
    throw VConstructionException( "The segment's index is negative.", ZEK::IResult::InvalidIndex );
  }
  VTargetRecord Record;
  Record.Kind = ETargetKind::LocalPointToWorldPoint;
  Record.Segment = static_cast< std::size_t >( i_rMarker.Segment );
  Record.Marker = i_Index;
  Record.Local.Point[0] = i_rMarker.Local.x;
  Record.Local.Point[1] = i_rMarker.Local.y;
  Record.Local.Point[2] = i_rMarker.Local.z;
  io_rSubject.AddTarget( FindTargetFactory( Record.Kind ).Create( Record ) );
}
} // namespace

std::unique_ptr< VComputeSubjectFK > VComputeSubjectFK::Build( const CoreMoxelTypes::VSubject& i_rSubject )
{
  auto pSubject = std::make_unique< VComputeSubjectFK >();
  for ( std::size_t Index = 0; Index < i_rSubject.Segments.size(); ++Index )
  {
    const CoreMoxelTypes::VSegment& rSegment = i_rSubject.Segments[Index];
    Telling( "Segment ", Index, rSegment.Name,
             [&]
             {
               AddSegmentOf( *pSubject, rSegment );
             } );
  }
  for ( std::size_t Index = 0; Index < i_rSubject.Markers.size(); ++Index )
  {
    const CoreMoxelTypes::VMarker& rMarker = i_rSubject.Markers[Index];
    if ( rMarker.Segment == -1 )
    {
      continue;
    }
    Telling( "Marker ", Index, rMarker.Name,
             [&]
             {
               AddTargetOf( *pSubject, rMarker, Index );
             } );
  }
  return pSubject;
}

ZEK::IResult VComputeSubjectFK::Build( const CoreMoxelTypes::VSubject& i_rSubject,
                                       std::unique_ptr< VComputeSubjectFK >& o_rpSubject, std::string& o_rMessage )
{
  o_rpSubject.reset();
  o_rMessage.clear();
  try
  {
    o_rpSubject = Build( i_rSubject );
    return {};
  }
  catch ( const VConstructionException& rFailure )
  {
    o_rMessage = std::string( "Subject \"" ).append( i_rSubject.Name ).append( "\": " ).append( rFailure.what() );
    return rFailure.Code();
  }
}

} // namespace ComputeSubject
