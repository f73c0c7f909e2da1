#include "OsimParts.h"

#include <algorithm>

namespace HostSources::Osim
{
namespace
{
constexpr std::size_t MostCoordinates = 4096;

/// Joints whose axes are known by their kind: which of the three turns and shifts each coordinate is.
struct VKind
{
  std::string_view Name;
  std::string_view Axes; ///< 0, 1, 2: turns about x, y, z; 3, 4, 5: shifts along them
};
constexpr VKind Kinds[] = { { "WeldJoint", "" },        { "PinJoint", "2" },     { "SliderJoint", "3" },
                            { "UniversalJoint", "01" }, { "BallJoint", "012" },  { "GimbalJoint", "012" },
                            { "FreeJoint", "012345" },  { "PlanarJoint", "234" } };
constexpr std::string_view Custom = "CustomJoint";

/// A frame that is fixed to a body.
struct VFrame
{
  std::string Body;
  CoreMoxelTypes::Rigid Pose;
};

VFrame ReadFrame( Xml::VNode i_pFrame, const std::string& i_rWhat )
{
  VFrame Frame;
  Frame.Body = LastPart( Xml::Text( Xml::Child( i_pFrame, "socket_parent" ) ) );
  const VVector Turn = ReadVector( Xml::Child( i_pFrame, "orientation" ), "the orientation of " + i_rWhat );
  const VVector Shift = ReadVector( Xml::Child( i_pFrame, "translation" ), "the translation of " + i_rWhat );
  Frame.Pose = RigidOf( TurnAbout( { 1, 0, 0 }, Turn[0] ) * TurnAbout( { 0, 1, 0 }, Turn[1] ) *
                            TurnAbout( { 0, 0, 1 }, Turn[2] ),
                        Shift );
  return Frame;
}

/// The body that a socket of the joint names, itself or by a frame of the joint.
VFrame FindFrame( Xml::VNode i_pJoint, std::string_view i_Socket, const VIndices& i_rBodies,
                  const std::string& i_rWhat )
{
  const std::string_view Path = Xml::Text( Xml::Child( i_pJoint, i_Socket ) );
  const std::string Name = LastPart( Path );
  const Xml::VNode pFrames = Xml::Child( i_pJoint, "frames" );
  for ( Xml::VNode pFrame = Xml::FirstChild( pFrames ); pFrame; pFrame = Xml::Next( pFrame ) )
  {
    if ( Xml::Attribute( pFrame, "name" ) == Name )
    {
      VFrame Frame = ReadFrame( pFrame, i_rWhat );
      if ( Frame.Body == GroundName || i_rBodies.contains( Frame.Body ) )
      {
        return Frame;
      }
      throw VReadFault( "expected a body that carries the frame " + Quoted( Name ) + " of " + i_rWhat + ", found " +
                        Quoted( Frame.Body ) );
    }
  }
  if ( Name == GroundName || i_rBodies.contains( Name ) )
  {
    return { Name, {} };
  }
  throw VReadFault( "expected a frame or a body for " + i_rWhat + ", found " + Quoted( Path ) );
}

std::vector< std::uint32_t > ReadCoordinates( Xml::VNode i_pJoint, VModel& io_rModel, VIndices& io_rCoordinates )
{
  std::vector< std::uint32_t > Own;
  const Xml::VNode pAll = Xml::Child( i_pJoint, "coordinates" );
  for ( Xml::VNode pOne = Xml::FirstChild( pAll ); pOne; pOne = Xml::Next( pOne ) )
  {
    VCoordinate Coordinate;
    Coordinate.Name = std::string( Xml::Attribute( pOne, "name" ) );
    const std::string What = "the default value of " + Quoted( Coordinate.Name );
    const auto Defaults = Xml::Numbers( Xml::Text( Xml::Child( pOne, "default_value" ) ), What );
    Coordinate.Default = Defaults.empty() ? 0 : Defaults[0];
    const auto Index = static_cast< std::uint32_t >( io_rModel.Coordinates.size() );
    if ( Coordinate.Name.empty() || !io_rCoordinates.emplace( Coordinate.Name, Index ).second ||
         Index >= MostCoordinates )
    {
      throw VReadFault( "expected at most " + std::to_string( MostCoordinates ) +
                        " coordinates with names of their own, found another " + Quoted( Coordinate.Name ) );
    }
    io_rModel.Coordinates.push_back( std::move( Coordinate ) );
    Own.push_back( Index );
  }
  return Own;
}

VVector UnitOf( const VVector& i_rVector, const std::string& i_rWhat )
{
  const double Length = LengthOf( i_rVector );
  if ( !( Length > 1e-9 ) )
  {
    throw VReadFault( "expected a direction for " + i_rWhat );
  }
  return { i_rVector[0] / Length, i_rVector[1] / Length, i_rVector[2] / Length };
}

VAxis ReadAxis( Xml::VNode i_pAxis, const VIndices& i_rCoordinates, const std::string& i_rWhat )
{
  VAxis Axis;
  for ( const std::string_view Name : Xml::Words( Xml::Text( Xml::Child( i_pAxis, "coordinates" ) ) ) )
  {
    Axis.Coordinates.push_back( IndexOf( i_rCoordinates, Name, "a coordinate of " + i_rWhat ) );
  }
  const Xml::VNode pFunction = VFunction::FindIn( i_pAxis, "function" );
  if ( pFunction == nullptr )
  {
    if ( !Axis.Coordinates.empty() )
    {
      throw VReadFault( "expected a function of " + i_rWhat );
    }
    return Axis;
  }
  Axis.Function = VFunction::Read( pFunction, Axis.Coordinates.size(), i_rWhat );
  if ( !Axis.Function.IsConstant() || Axis.Function.Value( {} ) != 0 )
  {
    Axis.Direction = UnitOf( ReadVector( Xml::Child( i_pAxis, "axis" ), "the axis of " + i_rWhat ), i_rWhat );
  }
  return Axis;
}

void ReadCustomAxes( Xml::VNode i_pJoint, const VIndices& i_rCoordinates, const std::string& i_rWhat, VJoint& o_rJoint )
{
  static constexpr std::string_view Names[] = { "rotation1",    "rotation2",    "rotation3",
                                                "translation1", "translation2", "translation3" };
  const Xml::VNode pTransform = Xml::Child( i_pJoint, "SpatialTransform" );
  for ( Xml::VNode pAxis = Xml::FirstChild( pTransform ); pAxis; pAxis = Xml::Next( pAxis ) )
  {
    const std::string_view Name = Xml::Attribute( pAxis, "name" );
    const auto* pName = std::find( std::begin( Names ), std::end( Names ), Name );
    if ( pName == std::end( Names ) )
    {
      throw VReadFault( "expected rotation1 to translation3 in " + i_rWhat + ", found " + Quoted( Name ) );
    }
    o_rJoint.Axes[static_cast< std::size_t >( pName - std::begin( Names ) )] =
        ReadAxis( pAxis, i_rCoordinates, std::string( Name ).append( " of " ).append( i_rWhat ) );
  }
}

/// A coordinate counts as an angle where a turn goes by it in proportion. One that moves turns and shifts by curves
/// alone is no measure of either, and motion files have it as it is.
void MarkAngles( const VJoint& i_rJoint, VModel& io_rModel )
{
  for ( std::size_t Index = 0; Index < 3; ++Index )
  {
    const VAxis& rAxis = i_rJoint.Axes[Index];
    for ( const std::uint32_t Coordinate : rAxis.Coordinates )
    {
      io_rModel.Coordinates[Coordinate].bAngle |= rAxis.Function.IsLinear();
    }
  }
}
} // namespace

VJointText ReadJoint( Xml::VNode i_pJoint, const VIndices& i_rBodies, VModel& io_rModel, VIndices& io_rCoordinates )
{
  VJointText Text;
  Text.Name = std::string( Xml::Attribute( i_pJoint, "name" ) );
  const std::string_view Kind = Xml::Name( i_pJoint );
  const std::string What = std::string( Kind ).append( " " ).append( Quoted( Text.Name ) );
  const VFrame Parent = FindFrame( i_pJoint, "socket_parent_frame", i_rBodies, What );
  const VFrame Child = FindFrame( i_pJoint, "socket_child_frame", i_rBodies, What );
  Text.Parent = Parent.Body;
  Text.Child = Child.Body;
  Text.Joint.ParentFrame = Parent.Pose;
  Text.Joint.ChildFrame = Child.Pose;
  const auto Own = ReadCoordinates( i_pJoint, io_rModel, io_rCoordinates );
  if ( Kind == Custom )
  {
    ReadCustomAxes( i_pJoint, io_rCoordinates, What, Text.Joint );
  }
  else
  {
    const auto* pKind = std::find_if( std::begin( Kinds ), std::end( Kinds ),
                                      [&]( const VKind& i_rKind )
                                      {
                                        return i_rKind.Name == Kind;
                                      } );
    if ( pKind == std::end( Kinds ) )
    {
      throw VReadFault( "expected a joint that is custom, welded, a pin, a slider, universal, a ball, a gimbal, planar "
                        "or free, found " +
                            What,
                        ZEK::IResult::NotSupported );
    }
    if ( Own.size() != pKind->Axes.size() )
    {
      throw VReadFault( "expected " + std::to_string( pKind->Axes.size() ) + " coordinates of " + What + ", found " +
                        std::to_string( Own.size() ) );
    }
    for ( std::size_t Index = 0; Index < Own.size(); ++Index )
    {
      const auto Place = static_cast< std::size_t >( pKind->Axes[Index] - '0' );
      VAxis& rAxis = Text.Joint.Axes[Place];
      rAxis.Direction[Place % 3] = 1;
      rAxis.Coordinates = { Own[Index] };
      rAxis.Function = VFunction::Identity();
    }
  }
  MarkAngles( Text.Joint, io_rModel );
  return Text;
}

} // namespace HostSources::Osim
