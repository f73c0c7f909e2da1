#include "OsimModel.h"

#include <QtCore/QFile>
#include <QtCore/QXmlStreamReader>

#include <algorithm>
#include <fstream>
#include <sstream>

namespace OsimModel
{
namespace
{
VVector Three( QXmlStreamReader& io_rXml )
{
  std::istringstream Text( io_rXml.readElementText().toStdString() );
  VVector Result{};
  Text >> Result[0] >> Result[1] >> Result[2];
  return Result;
}

std::string LastPart( const std::string& i_rPath )
{
  return i_rPath.substr( i_rPath.rfind( '/' ) + 1 );
}

/// One start of an element within the joints.
void TakeElement( QXmlStreamReader& io_rXml, std::vector< VJoint >& io_rJoints, VFrame*& io_rpFrame )
{
  const std::string Name = io_rXml.name().toString().toStdString();
  const std::string Label = io_rXml.attributes().value( "name" ).toString().toStdString();
  if ( Name.ends_with( "Joint" ) && !Label.empty() )
  {
    io_rJoints.push_back( { Name, Label, {}, {}, {}, {}, {} } );
    return;
  }
  if ( io_rJoints.empty() )
  {
    return;
  }
  VJoint& rJoint = io_rJoints.back();
  const auto Text = [&]
  {
    return io_rXml.readElementText().trimmed().toStdString();
  };
  if ( Name == "socket_parent_frame" )
  {
    rJoint.ParentFrame = LastPart( Text() );
  }
  else if ( Name == "socket_child_frame" )
  {
    rJoint.ChildFrame = LastPart( Text() );
  }
  else if ( Name == "Coordinate" )
  {
    rJoint.Coordinates.push_back( Label );
  }
  else if ( Name == "PhysicalOffsetFrame" )
  {
    io_rpFrame = &rJoint.Frames[Label];
  }
  else if ( Name == "socket_parent" && io_rpFrame )
  {
    io_rpFrame->Body = LastPart( Text() );
  }
  else if ( Name == "translation" && io_rpFrame )
  {
    io_rpFrame->Translation = Three( io_rXml );
  }
  else if ( Name == "orientation" && io_rpFrame )
  {
    io_rpFrame->Orientation = Three( io_rXml );
  }
  else if ( Name == "TransformAxis" )
  {
    rJoint.Axes.emplace_back();
  }
  else if ( Name == "coordinates" && !rJoint.Axes.empty() )
  {
    rJoint.Axes.back().Coordinate = Text();
  }
  else if ( Name == "axis" && !rJoint.Axes.empty() )
  {
    rJoint.Axes.back().Direction = Three( io_rXml );
  }
  else if ( Name == "coefficients" && !rJoint.Axes.empty() )
  {
    rJoint.Axes.back().Slope = Three( io_rXml )[0];
  }
}

void TakeRows( std::istream& io_rStream, const std::vector< std::string >& i_rNames, char i_Separator,
               VTable& o_rTable )
{
  for ( std::string Line; std::getline( io_rStream, Line ); )
  {
    std::replace( Line.begin(), Line.end(), i_Separator, ' ' );
    std::istringstream Row( Line );
    for ( const std::string& rName : i_rNames )
    {
      Row >> o_rTable[rName].emplace_back();
    }
  }
}

std::vector< std::string > Names( std::string i_Line, char i_Separator )
{
  std::replace( i_Line.begin(), i_Line.end(), i_Separator, ' ' );
  std::istringstream Stream( i_Line );
  std::vector< std::string > Result;
  for ( std::string Name; Stream >> Name; )
  {
    Result.push_back( Name );
  }
  return Result;
}
} // namespace

std::vector< VJoint > ReadJoints( const std::filesystem::path& i_rFile )
{
  QFile File( QString::fromStdString( i_rFile.string() ) );
  std::vector< VJoint > Joints;
  if ( !File.open( QIODevice::ReadOnly ) )
  {
    return Joints;
  }
  QXmlStreamReader Xml( &File );
  VFrame* pFrame = nullptr;
  bool bJoints = false;
  while ( !Xml.atEnd() )
  {
    Xml.readNext();
    if ( Xml.name() == QLatin1String( "JointSet" ) )
    {
      bJoints = Xml.isStartElement();
    }
    else if ( bJoints && Xml.isStartElement() )
    {
      TakeElement( Xml, Joints, pFrame );
    }
    else if ( Xml.isEndElement() && Xml.name() == QLatin1String( "PhysicalOffsetFrame" ) )
    {
      pFrame = nullptr;
    }
  }
  return Joints;
}

VTable ReadMotion( const std::filesystem::path& i_rFile )
{
  std::ifstream Stream( i_rFile );
  std::string Line;
  while ( std::getline( Stream, Line ) && !Line.starts_with( "endheader" ) )
  {
  }
  std::getline( Stream, Line );
  VTable Table;
  TakeRows( Stream, Names( Line, '\t' ), '\t', Table );
  for ( auto& [Name, rColumn] : Table )
  {
    const bool bLength =
        Name == "time" || Name.ends_with( "_tx" ) || Name.ends_with( "_ty" ) || Name.ends_with( "_tz" );
    for ( double& rValue : rColumn )
    {
      rValue *= bLength ? 1 : 3.14159265358979323846 / 180;
    }
  }
  return Table;
}

VTable ReadSegments( const std::filesystem::path& i_rFile )
{
  std::ifstream Stream( i_rFile );
  std::string Line;
  std::getline( Stream, Line );
  VTable Table;
  TakeRows( Stream, Names( Line.substr( Line.find( ' ' ) ), ',' ), ',', Table );
  return Table;
}

} // namespace OsimModel
