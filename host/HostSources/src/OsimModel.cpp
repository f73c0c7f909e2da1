#include "OsimParts.h"

#include "ReaderSupport.h"

#include <algorithm>
#include <cmath>

namespace HostSources::Osim
{
namespace
{
constexpr std::size_t MostBodies = 4096, MostMarkers = 65536;
/// Files of earlier versions hold their joints within the bodies.
constexpr double EarliestVersion = 40000;

Xml::VNode ObjectsOf( Xml::VNode i_pModel, std::string_view i_Set )
{
  return Xml::FirstChild( Xml::Child( Xml::Child( i_pModel, i_Set ), "objects" ) );
}

Xml::VNode FindModel( Xml::VNode i_pRoot )
{
  if ( Xml::Name( i_pRoot ) != "OpenSimDocument" )
  {
    throw VReadFault( "expected the root element of a model, found " + Quoted( Xml::Name( i_pRoot ) ) );
  }
  const auto Version = Xml::Numbers( Xml::Attribute( i_pRoot, "Version" ), "the version of the model" );
  if ( Version.size() != 1 || Version[0] < EarliestVersion )
  {
    throw VReadFault( "expected a model of version 40000 or later, found " +
                          Quoted( Xml::Attribute( i_pRoot, "Version" ) ) +
                          "; the program that made it can save it anew",
                      ZEK::IResult::NotSupported );
  }
  const Xml::VNode pModel = Xml::Child( i_pRoot, "Model" );
  if ( pModel == nullptr )
  {
    throw VReadFault( "expected a model in the file, found " + Quoted( Xml::Name( Xml::FirstChild( i_pRoot ) ) ) );
  }
  if ( const auto Unit = Xml::Text( Xml::Child( pModel, "length_units" ) ); !Unit.empty() && Unit != "meters" )
  {
    throw VReadFault( "expected lengths in meters, found " + Quoted( Unit ), ZEK::IResult::NotSupported );
  }
  return pModel;
}

void TakeUpAxis( Xml::VNode i_pModel, VModel& o_rModel )
{
  const VVector Gravity = ReadVector( Xml::Child( i_pModel, "gravity" ), "gravity" );
  const bool bZ = -Gravity[2] > std::abs( Gravity[0] ) && -Gravity[2] > std::abs( Gravity[1] );
  const bool bY = -Gravity[1] > std::abs( Gravity[0] ) && -Gravity[1] > std::abs( Gravity[2] );
  o_rModel.UpAxis = bZ ? EUpAxis::Z : EUpAxis::Y;
  o_rModel.UpAxisReason = bZ   ? "z is up: the model's gravity points against it."
                          : bY ? "y is up: the model's gravity points against it."
                               : "y is up: models have it so; this one's gravity points along neither y nor z.";
}

/// The bodies in the order of the file; their names lead to them.
std::vector< VBody > ReadBodies( Xml::VNode i_pModel, VIndices& o_rIndices )
{
  std::vector< VBody > Bodies;
  for ( Xml::VNode pBody = ObjectsOf( i_pModel, "BodySet" ); pBody; pBody = Xml::Next( pBody ) )
  {
    VBody Body;
    Body.Name = std::string( Xml::Attribute( pBody, "name" ) );
    Body.MassCentre = ReadVector( Xml::Child( pBody, "mass_center" ), "the centre of mass of " + Quoted( Body.Name ) );
    const auto Index = static_cast< std::uint32_t >( Bodies.size() );
    if ( Body.Name.empty() || Body.Name == GroundName || !o_rIndices.emplace( Body.Name, Index ).second )
    {
      throw VReadFault( "expected bodies with names of their own, found another " + Quoted( Body.Name ) );
    }
    Bodies.push_back( std::move( Body ) );
    if ( Bodies.size() > MostBodies )
    {
      throw VReadFault( "expected at most " + std::to_string( MostBodies ) + " bodies", ZEK::IResult::NotSupported );
    }
  }
  return Bodies;
}

/// Takes the bodies from the ground on, each behind its parent.
void OrderBodies( std::vector< VBody > i_Bodies, const std::vector< VJointText >& i_rJoints, VModel& o_rModel,
                  VIndices& io_rIndices )
{
  std::unordered_multimap< std::string_view, const VJointText* > Below;
  std::vector< bool > bHung( i_Bodies.size(), false );
  for ( const VJointText& rJoint : i_rJoints )
  {
    const std::uint32_t Child = IndexOf( io_rIndices, rJoint.Child, "the moved body of " + Quoted( rJoint.Name ) );
    if ( bHung[Child] )
    {
      throw VReadFault( "expected one joint for each body, found two for " + Quoted( rJoint.Child ) );
    }
    bHung[Child] = true;
    Below.emplace( rJoint.Parent, &rJoint );
  }
  const auto Hang = [&]( std::string_view i_Parent, std::int32_t i_Index )
  {
    std::vector< std::pair< std::uint32_t, const VJointText* > > Children;
    const auto [First, Last] = Below.equal_range( i_Parent );
    for ( auto It = First; It != Last; ++It )
    {
      Children.emplace_back( io_rIndices.at( It->second->Child ), It->second );
    }
    std::sort( Children.begin(), Children.end() ); // as the file has them
    for ( const auto& [Child, pJoint] : Children )
    {
      VBody Body = i_Bodies[Child];
      Body.Parent = i_Index;
      Body.Joint = pJoint->Joint;
      o_rModel.Bodies.push_back( std::move( Body ) );
    }
  };
  Hang( GroundName, -1 );
  for ( std::size_t Index = 0; Index < o_rModel.Bodies.size(); ++Index )
  {
    const std::string Name = o_rModel.Bodies[Index].Name;
    Hang( Name, static_cast< std::int32_t >( Index ) );
  }
  VIndices Ordered;
  for ( std::size_t Index = 0; Index < o_rModel.Bodies.size(); ++Index )
  {
    Ordered.emplace( o_rModel.Bodies[Index].Name, static_cast< std::uint32_t >( Index ) );
  }
  for ( const VBody& rBody : i_Bodies )
  {
    if ( !Ordered.contains( rBody.Name ) )
    {
      throw VReadFault( "expected bodies that hang on the ground by joints, found " + Quoted( rBody.Name ) +
                        ", which does not" );
    }
  }
  io_rIndices = std::move( Ordered );
}

VCoupler ReadCoupler( Xml::VNode i_pCoupler, const VIndices& i_rCoordinates )
{
  const std::string What = "the coupling " + Quoted( Xml::Attribute( i_pCoupler, "name" ) );
  VCoupler Coupler;
  for ( const auto Name : Xml::Words( Xml::Text( Xml::Child( i_pCoupler, "independent_coordinate_names" ) ) ) )
  {
    Coupler.Independents.push_back( IndexOf( i_rCoordinates, Name, "a coordinate of " + What ) );
  }
  Coupler.Dependent = IndexOf( i_rCoordinates, Xml::Text( Xml::Child( i_pCoupler, "dependent_coordinate_name" ) ),
                               "the coordinate that follows in " + What );
  Coupler.Function = VFunction::Read( VFunction::FindIn( i_pCoupler, "coupled_coordinates_function" ),
                                      Coupler.Independents.size(), What );
  const auto Scale = Xml::Numbers( Xml::Text( Xml::Child( i_pCoupler, "scale_factor" ) ), "the scale of " + What );
  Coupler.Scale = Scale.empty() ? 1 : Scale[0];
  return Coupler;
}

/// Puts each coupling behind those that it depends on.
void OrderCouplers( std::vector< VCoupler > i_Couplers, VModel& o_rModel )
{
  std::vector< std::int32_t > Open( o_rModel.Coordinates.size(), 0 ); // couplings of the coordinate still to come
  for ( const VCoupler& rCoupler : i_Couplers )
  {
    if ( ++Open[rCoupler.Dependent] > 1 )
    {
      throw VReadFault( "expected one coupling for each coordinate, found two for " +
                        Quoted( o_rModel.Coordinates[rCoupler.Dependent].Name ) );
    }
  }
  while ( !i_Couplers.empty() )
  {
    const auto Ready =
        std::stable_partition( i_Couplers.begin(), i_Couplers.end(),
                               [&]( const VCoupler& i_rCoupler )
                               {
                                 return std::any_of( i_rCoupler.Independents.begin(), i_rCoupler.Independents.end(),
                                                     [&]( std::uint32_t i_Index )
                                                     {
                                                       return Open[i_Index] > 0;
                                                     } );
                               } );
    if ( Ready == i_Couplers.end() )
    {
      throw VReadFault( "expected couplings of coordinates without a circle, found one through " +
                        Quoted( o_rModel.Coordinates[i_Couplers[0].Dependent].Name ) );
    }
    for ( auto It = Ready; It != i_Couplers.end(); ++It )
    {
      Open[It->Dependent] = 0;
      o_rModel.Couplers.push_back( std::move( *It ) );
    }
    i_Couplers.erase( Ready, i_Couplers.end() );
  }
}

void ReadConstraints( Xml::VNode i_pModel, const VIndices& i_rCoordinates, VModel& io_rModel )
{
  std::vector< VCoupler > Couplers;
  std::size_t Others = 0;
  for ( Xml::VNode pOne = ObjectsOf( i_pModel, "ConstraintSet" ); pOne; pOne = Xml::Next( pOne ) )
  {
    if ( Xml::Text( Xml::Child( pOne, "isEnforced" ) ) == "false" )
    {
      continue;
    }
    if ( Xml::Name( pOne ) == "CoordinateCouplerConstraint" )
    {
      Couplers.push_back( ReadCoupler( pOne, i_rCoordinates ) );
    }
    else
    {
      ++Others;
    }
  }
  OrderCouplers( std::move( Couplers ), io_rModel );
  if ( Others > 0 )
  {
    io_rModel.Notes.push_back( "The model's constraints other than couplings of coordinates were left out: " +
                               std::to_string( Others ) + "." );
  }
}

void ReadMarkers( Xml::VNode i_pModel, const VIndices& i_rBodies, VModel& io_rModel )
{
  std::size_t Others = 0;
  for ( Xml::VNode pOne = ObjectsOf( i_pModel, "MarkerSet" ); pOne; pOne = Xml::Next( pOne ) )
  {
    VMarker Marker;
    Marker.Name = ToUtf8( Xml::Attribute( pOne, "name" ) );
    Marker.Place = ReadVector( Xml::Child( pOne, "location" ), "the place of the marker " + Quoted( Marker.Name ) );
    const auto Body = i_rBodies.find( LastPart( Xml::Text( Xml::Child( pOne, "socket_parent_frame" ) ) ) );
    if ( Body == i_rBodies.end() || io_rModel.Markers.size() >= MostMarkers )
    {
      ++Others;
      continue;
    }
    Marker.Body = Body->second;
    io_rModel.Markers.push_back( std::move( Marker ) );
  }
  if ( Others > 0 )
  {
    io_rModel.Notes.push_back(
        "Markers of the model that are on none of its bodies were left out: " + std::to_string( Others ) + "." );
  }
}
} // namespace

std::string Quoted( std::string_view i_Text )
{
  return std::string( "\"" ).append( ToUtf8( i_Text.substr( 0, 60 ) ) ).append( "\"" );
}

std::string LastPart( std::string_view i_Path )
{
  return std::string( i_Path.substr( i_Path.rfind( '/' ) + 1 ) );
}

VVector ReadVector( Xml::VNode i_pElement, const std::string& i_rWhat )
{
  const auto Numbers = Xml::Numbers( Xml::Text( i_pElement ), i_rWhat );
  if ( Numbers.empty() && i_pElement == nullptr )
  {
    return {};
  }
  if ( Numbers.size() != 3 )
  {
    throw VReadFault( "expected three numbers for " + i_rWhat + ", found " + std::to_string( Numbers.size() ) );
  }
  return { Numbers[0], Numbers[1], Numbers[2] };
}

std::uint32_t IndexOf( const VIndices& i_rIndices, std::string_view i_Name, const std::string& i_rWhat )
{
  const auto It = i_rIndices.find( std::string( i_Name ) );
  if ( It == i_rIndices.end() )
  {
    throw VReadFault( "expected " + i_rWhat + ", found " + Quoted( i_Name ) + ", which the model does not have" );
  }
  return It->second;
}

VModel ReadModel( std::span< const std::byte > i_Bytes )
{
  const Xml::VDocument Document( i_Bytes );
  const Xml::VNode pModel = FindModel( Document.Root() );
  VModel Model;
  Model.Name = ToUtf8( Xml::Attribute( pModel, "name" ) );
  TakeUpAxis( pModel, Model );
  VIndices BodyIndices, Coordinates;
  std::vector< VBody > Bodies = ReadBodies( pModel, BodyIndices );
  std::vector< VJointText > Joints;
  for ( Xml::VNode pJoint = ObjectsOf( pModel, "JointSet" ); pJoint; pJoint = Xml::Next( pJoint ) )
  {
    Joints.push_back( ReadJoint( pJoint, BodyIndices, Model, Coordinates ) );
  }
  OrderBodies( std::move( Bodies ), Joints, Model, BodyIndices );
  if ( Model.Bodies.empty() || Model.Coordinates.empty() )
  {
    throw VReadFault( "expected a model with bodies and coordinates, found none" );
  }
  ReadConstraints( pModel, Coordinates, Model );
  ReadMarkers( pModel, BodyIndices, Model );
  return Model;
}

} // namespace HostSources::Osim
