#include "OsimSkeleton.h"

#include "ReaderSupport.h"
#include "RecordingSubjects.h"

#include <algorithm>

namespace HostSources::Osim
{
namespace
{
using CoreMoxelTypes::EJointType;
using CoreMoxelTypes::Rigid;
constexpr double Metre = 1000; // mm

Rigid InMillimetres( Rigid i_Rigid )
{
  for ( double& rValue : i_Rigid.T )
  {
    rValue *= Metre;
  }
  return i_Rigid;
}

bool IsFixed( const VJoint& i_rJoint, std::size_t i_First )
{
  return std::all_of( i_rJoint.Axes.begin() + static_cast< std::ptrdiff_t >( i_First ),
                      i_rJoint.Axes.begin() + static_cast< std::ptrdiff_t >( i_First ) + 3,
                      []( const VAxis& i_rAxis )
                      {
                        return i_rAxis.Function.IsConstant();
                      } );
}
} // namespace

VPoser::VPoser( const VModel& i_rModel )
  : m_rModel( i_rModel )
{
  std::vector< double > Defaults;
  for ( const VCoordinate& rCoordinate : i_rModel.Coordinates )
  {
    Defaults.push_back( rCoordinate.Default );
  }
  Couple( Defaults );
  m_Subject.Id = 1;
  m_Subject.Name = i_rModel.Name;
  AddBodies( Defaults );
  AddBones( Defaults );
  AddMarkers();
}

VPoser::VMoved VPoser::Moved( const VJoint& i_rJoint, const std::vector< double >& i_rValues ) const
{
  VMoved Result;
  for ( std::size_t Index = 0; Index < i_rJoint.Axes.size(); ++Index )
  {
    const VAxis& rAxis = i_rJoint.Axes[Index];
    m_Arguments.clear();
    for ( const std::uint32_t Coordinate : rAxis.Coordinates )
    {
      m_Arguments.push_back( i_rValues[Coordinate] );
    }
    const double Value = rAxis.Function.Value( m_Arguments );
    if ( Index < 3 )
    {
      Result.Turn = Result.Turn * TurnAbout( rAxis.Direction, Value );
      continue;
    }
    for ( std::size_t Axis = 0; Axis < 3; ++Axis )
    {
      Result.Shift[Axis] += Metre * Value * rAxis.Direction[Axis];
    }
  }
  return Result;
}

void VPoser::Couple( std::vector< double >& io_rValues ) const
{
  for ( const VCoupler& rCoupler : m_rModel.Couplers )
  {
    m_Arguments.clear();
    for ( const std::uint32_t Coordinate : rCoupler.Independents )
    {
      m_Arguments.push_back( io_rValues[Coordinate] );
    }
    io_rValues[rCoupler.Dependent] = rCoupler.Scale * rCoupler.Function.Value( m_Arguments );
  }
}

void VPoser::AddBodies( const std::vector< double >& i_rDefaults )
{
  for ( const VBody& rBody : m_rModel.Bodies )
  {
    CoreMoxelTypes::VSegment Segment;
    Segment.Name = ToUtf8( rBody.Name );
    Segment.Parent = rBody.Parent;
    Segment.Pre = InMillimetres( rBody.Joint.ParentFrame );
    Segment.Post = Inverse( InMillimetres( rBody.Joint.ChildFrame ) );
    Segment.Joint = EJointType::Free;
    if ( IsFixed( rBody.Joint, 3 ) )
    {
      const VMoved Fixed = Moved( rBody.Joint, i_rDefaults );
      const bool bFixed = IsFixed( rBody.Joint, 0 );
      Segment.Joint = bFixed ? EJointType::Dummy : EJointType::Ball;
      Segment.Pre = Segment.Pre * RigidOf( bFixed ? Fixed.Turn : VQuaternion{ 1, 0, 0, 0 }, Fixed.Shift );
    }
    m_StateSize += Segment.Joint == EJointType::Free ? 6 : Segment.Joint == EJointType::Ball ? 3 : 0;
    m_Subject.Segments.push_back( std::move( Segment ) );
  }
}

void VPoser::AddBone( std::size_t i_Body, const VVector& i_rTo, std::string i_Name )
{
  constexpr double Shortest = 1; // mm
  const double* pFrom = m_rModel.Bodies[i_Body].Joint.ChildFrame.T;
  const VVector Along{ i_rTo[0] - pFrom[0] * Metre, i_rTo[1] - pFrom[1] * Metre, i_rTo[2] - pFrom[2] * Metre };
  const double Length = LengthOf( Along );
  if ( !( Length > Shortest && Length < Farthest ) )
  {
    return;
  }
  CoreMoxelTypes::VSegment Bone;
  Bone.Name = std::move( i_Name );
  Bone.Parent = static_cast< std::int32_t >( i_Body );
  Bone.Joint = EJointType::Dummy;
  Bone.Pre = TurnTo( Along );
  std::transform( pFrom, pFrom + 3, Bone.Pre.T,
                  []( double i_Value )
                  {
                    return i_Value * Metre;
                  } );
  Bone.BoneLength = static_cast< float >( Length );
  m_Subject.Segments.push_back( std::move( Bone ) );
}

std::pair< VVector, const char* > VPoser::EndOf( std::size_t i_Body ) const
{
  VVector Sum{};
  double Count = 0;
  for ( const VMarker& rMarker : m_rModel.Markers )
  {
    if ( rMarker.Body == i_Body )
    {
      for ( std::size_t Axis = 0; Axis < 3; ++Axis )
      {
        Sum[Axis] += rMarker.Place[Axis];
      }
      ++Count;
    }
  }
  const VVector& rEnd = Count > 0 ? Sum : m_rModel.Bodies[i_Body].MassCentre;
  const double Scale = Metre / std::max( Count, 1.0 );
  return { { rEnd[0] * Scale, rEnd[1] * Scale, rEnd[2] * Scale }, Count > 0 ? " to its markers" : " to its centre" };
}

void VPoser::AddBones( const std::vector< double >& i_rDefaults )
{
  std::vector< bool > bParent( m_rModel.Bodies.size(), false );
  for ( const VBody& rBody : m_rModel.Bodies )
  {
    if ( rBody.Parent < 0 )
    {
      continue;
    }
    const auto Parent = static_cast< std::size_t >( rBody.Parent );
    bParent[Parent] = true;
    const Rigid Joint =
        InMillimetres( rBody.Joint.ParentFrame ) * RigidOf( { 1, 0, 0, 0 }, Moved( rBody.Joint, i_rDefaults ).Shift );
    AddBone( Parent, { Joint.T[0], Joint.T[1], Joint.T[2] },
             std::string( m_Subject.Segments[Parent].Name ).append( " to " ).append( ToUtf8( rBody.Name ) ) );
  }
  for ( std::size_t Index = 0; Index < bParent.size(); ++Index )
  {
    if ( !bParent[Index] )
    {
      const auto [End, pWhat] = EndOf( Index );
      AddBone( Index, End, std::string( m_Subject.Segments[Index].Name ).append( pWhat ) );
    }
  }
}

void VPoser::AddMarkers()
{
  for ( const VMarker& rMarker : m_rModel.Markers )
  {
    CoreMoxelTypes::VMarker Marker;
    Marker.Id = static_cast< std::uint32_t >( m_Subject.Markers.size() );
    Marker.Name = rMarker.Name;
    Marker.Segment = static_cast< std::int32_t >( rMarker.Body );
    Marker.Local = { rMarker.Place[0] * Metre, rMarker.Place[1] * Metre, rMarker.Place[2] * Metre };
    Marker.Radius = MarkerRadius;
    m_Subject.Markers.push_back( std::move( Marker ) );
  }
}

void VPoser::AppendState( std::vector< double >& io_rValues, std::vector< double >& io_rStates ) const
{
  Couple( io_rValues );
  for ( std::size_t Index = 0; Index < m_rModel.Bodies.size(); ++Index )
  {
    const EJointType Kind = m_Subject.Segments[Index].Joint;
    if ( Kind == EJointType::Dummy )
    {
      continue;
    }
    const VMoved Now = Moved( m_rModel.Bodies[Index].Joint, io_rValues );
    const VVector Turn = RotationVector( Now.Turn );
    io_rStates.insert( io_rStates.end(), Turn.begin(), Turn.end() );
    if ( Kind == EJointType::Free )
    {
      io_rStates.insert( io_rStates.end(), Now.Shift.begin(), Now.Shift.end() );
    }
  }
}

} // namespace HostSources::Osim
