#include "Program.h"

#include <TestSupport/Paths.h>

#include <QtCore/QFile>
#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtGui/QImage>

#include <gtest/gtest.h>

#include <cmath>

using namespace ProgramTest;

namespace
{
/// How images stand in their tiles.
enum ETurn
{
  EUpright,
  ESnapped,
  ERolled
};

/// What a hand does to the views.
struct VHand
{
  double Ratio = 1;
  int Zoomed = -1; ///< the tile that the wheel is turned over
  int Panned = -1; ///< the tile that is dragged by `Drag`, device pixels
  QPointF Drag;
};

/// What is asked of the program, and what it does to the views.
struct VCase
{
  const char* pName;
  const char* pFolder;
  const char* pTime;
  QStringList Arguments;
  ETurn Turn = ESnapped;
  bool bCorrected = false; ///< for the lens
  VHand Hand;
};

struct VCamera
{
  QString URN;
  double Width = 0, Height = 0;
  QPointF Centre;
  double K[3]{};
  double Roll = 0;
  std::vector< QPointF > Seen; ///< raw sensor pixels
};

/// A camera's place in the frame and the part of its image that is looked at; y down.
struct VTile
{
  QRect Rect;
  double ScaleX = 1, ScaleY = 1, Zoom = 0.9, PanX = 0.5, PanY = 0.5;
};

double Number( const QJsonValue& i_rValue, int i_Index )
{
  return i_rValue.toArray()[i_Index].toDouble();
}

/// How far the camera leans, from its turn vector: the angle between the image's up and that of the world.
double RollOf( const QJsonValue& i_rTurn )
{
  const double X = Number( i_rTurn, 0 ), Y = Number( i_rTurn, 1 ), Z = Number( i_rTurn, 2 );
  const double Angle = std::sqrt( X * X + Y * Y + Z * Z );
  const double x = X / Angle, y = Y / Angle, z = Z / Angle, C = std::cos( Angle ), S = std::sin( Angle );
  // The world's z in the camera's x (right) and y (down).
  const double UpX = ( 1 - C ) * x * z + S * y, UpY = ( 1 - C ) * y * z - S * x;
  return std::atan2( UpX, -UpY );
}

std::vector< VCamera > Cameras( const QString& i_rCalibration )
{
  const VRun Run = Harrow( { "inspect", "cameras", i_rCalibration } );
  std::vector< VCamera > Found;
  for ( const QJsonValue& rValue : QJsonDocument::fromJson( Run.Output.toUtf8() ).object()["cameras"].toArray() )
  {
    const QJsonObject Calibration = rValue["calibration"].toObject();
    VCamera Camera;
    Camera.URN = rValue["name"].toString();
    Camera.Width = Number( rValue["sensor"], 0 );
    Camera.Height = Number( rValue["sensor"], 1 );
    Camera.Centre = { Number( Calibration["distortionCentre"], 0 ), Number( Calibration["distortionCentre"], 1 ) };
    for ( int Index = 0; Index < 3; ++Index )
    {
      Camera.K[Index] = Number( Calibration["radialParameters"], Index );
    }
    Camera.Roll = RollOf( Calibration["rotation"] );
    Found.push_back( Camera );
  }
  return Found;
}

/// What a pose estimator wrote for one frame.
std::vector< QPointF > Keypoints( const QString& i_rFile )
{
  std::vector< QPointF > Found;
  for ( const QJsonValue& rPerson : ReadJson( i_rFile.toStdString() )["people"].toArray() )
  {
    const QJsonArray Values = rPerson["pose_keypoints_2d"].toArray();
    for ( int Index = 0; Index + 2 < Values.size(); Index += 3 )
    {
      if ( Values[Index + 2].toDouble() > 0 )
      {
        Found.emplace_back( Values[Index].toDouble(), Values[Index + 1].toDouble() );
      }
    }
  }
  return Found;
}

std::vector< QPointF > BoardCorners( const QString& i_rFile, int i_Sync, int i_Camera )
{
  std::vector< QPointF > Found;
  QFile File( i_rFile );
  EXPECT_TRUE( File.open( QIODevice::ReadOnly ) );
  for ( const QByteArray& rLine : File.readAll().split( '\n' ) )
  {
    const QList< QByteArray > Cells = rLine.split( ',' );
    if ( Cells.size() > 5 && Cells[0] == QByteArray::number( i_Sync ) && Cells[1] == QByteArray::number( i_Camera ) )
    {
      Found.emplace_back( Cells[4].toDouble(), Cells[5].toDouble() );
    }
  }
  return Found;
}

void ReadSeen( const VCase& i_rCase, const QJsonObject& i_rFrame, std::vector< VCamera >& io_rCameras )
{
  const QString Folder = Recording( i_rCase.pFolder );
  const int Index = i_rFrame["index"].toInt();
  for ( int Camera = 0; Camera < static_cast< int >( io_rCameras.size() ); ++Camera )
  {
    const QString Name = QString( "cam0%1" ).arg( Camera + 1 );
    io_rCameras[static_cast< std::size_t >( Camera )].Seen =
        Folder.endsWith( "board" ) ? BoardCorners( Folder + "/points2d.csv", i_rFrame["number"].toInt(), Camera )
        : Folder.endsWith( "static" )
            ? Keypoints( QString( "%1/%2/Static_cam_0%3.%4.json" )
                             .arg( Folder, Name )
                             .arg( Camera + 1 )
                             .arg( Index, 5, 10, QChar( '0' ) ) )
            : Keypoints( QString( "%1/%2/%2.%3.json" ).arg( Folder, Name ).arg( Index, 4, 10, QChar( '0' ) ) );
  }
}

double Angle( const VCamera& i_rCamera, ETurn i_Turn )
{
  return i_Turn == ERolled ? i_rCamera.Roll : i_Turn == ESnapped ? std::round( i_rCamera.Roll / M_PI_2 ) * M_PI_2 : 0.0;
}

/// Width and height of the box around the turned image.
QSizeF Box( const VCamera& i_rCamera, ETurn i_Turn )
{
  const double C = std::abs( std::cos( Angle( i_rCamera, i_Turn ) ) ),
               S = std::abs( std::sin( Angle( i_rCamera, i_Turn ) ) );
  return { C * i_rCamera.Width + S * i_rCamera.Height, S * i_rCamera.Width + C * i_rCamera.Height };
}

/// The number of columns that lets images fill their cells best; of equals, the one with fewer rows.
int BestColumns( const std::vector< QSizeF >& i_rBoxes, QSize i_Frame )
{
  const int Count = static_cast< int >( i_rBoxes.size() );
  int Best = Count;
  double BestScore = 0;
  for ( int Rows = 1; Rows <= Count; ++Rows )
  {
    const int Columns = ( Count + Rows - 1 ) / Rows;
    const double Cell = double( i_Frame.width() / Columns ) / ( i_Frame.height() / Rows );
    double Score = 0;
    for ( const QSizeF& rBox : i_rBoxes )
    {
      const double Share = Cell * rBox.height() / rBox.width();
      Score += std::min( Share, 1 / Share ) / ( Columns * Rows );
    }
    if ( Columns * Rows - Count < Columns && Score > BestScore )
    {
      BestScore = Score;
      Best = Columns;
    }
  }
  return Best;
}

std::vector< VTile > LayOut( const std::vector< VCamera >& i_rCameras, QSize i_Frame, ETurn i_Turn )
{
  std::vector< QSizeF > Boxes;
  for ( const VCamera& rCamera : i_rCameras )
  {
    Boxes.push_back( Box( rCamera, i_Turn ) );
  }
  const int Count = static_cast< int >( i_rCameras.size() ), Columns = BestColumns( Boxes, i_Frame );
  const int Rows = ( Count + Columns - 1 ) / Columns;
  const int Width = i_Frame.width() / Columns, Height = i_Frame.height() / Rows,
            First = i_Frame.height() - ( Rows - 1 ) * Height;
  std::vector< VTile > Tiles;
  for ( int Index = 0; Index < Count; ++Index )
  {
    const auto At = static_cast< std::size_t >( Index );
    const int Row = Index / Columns;
    VTile Tile;
    Tile.Rect = Row == 0 ? QRect( Index * Width, 0, Width, First )
                         : QRect( Index % Columns * Width, First + ( Row - 1 ) * Height, Width, Height );
    // Pixels of a cell for one of the sensor, so that the box just fits into the cell.
    const double Fit = std::min( Width / Boxes[At].width(), Height / Boxes[At].height() );
    Tile.ScaleX = Fit * i_rCameras[At].Width / Width;
    Tile.ScaleY = Fit * i_rCameras[At].Height / Height;
    Tiles.push_back( Tile );
  }
  return Tiles;
}

QPointF Place( const VCamera& i_rCamera, const VTile& i_rTile, const VCase& i_rCase, QPointF i_Seen )
{
  QPointF At = i_Seen;
  if ( i_rCase.bCorrected )
  {
    const QPointF Way = At - i_rCamera.Centre;
    const double D = QPointF::dotProduct( Way, Way );
    At = i_rCamera.Centre + Way * ( 1 + i_rCamera.K[0] * D + i_rCamera.K[1] * D * D + i_rCamera.K[2] * D * D * D );
  }
  // (0, 0) is the centre of the first pixel.
  const QPointF Way = At + QPointF( 0.5, 0.5 ) - i_rCamera.Centre;
  const double C = std::cos( Angle( i_rCamera, i_rCase.Turn ) ), S = std::sin( Angle( i_rCamera, i_rCase.Turn ) );
  const QPointF Turned = i_rCamera.Centre + QPointF( C * Way.x() + S * Way.y(), C * Way.y() - S * Way.x() );
  const double U = ( Turned.x() / i_rCamera.Width - i_rTile.PanX ) * i_rTile.ScaleX * i_rTile.Zoom;
  const double V = ( Turned.y() / i_rCamera.Height - i_rTile.PanY ) * i_rTile.ScaleY * i_rTile.Zoom;
  return { i_rTile.Rect.x() + ( 0.5 + U ) * i_rTile.Rect.width(),
           i_rTile.Rect.y() + ( 0.5 + V ) * i_rTile.Rect.height() };
}

QRect RectOf( const QJsonValue& i_rTile )
{
  const QJsonObject Rect = i_rTile["rect"].toObject();
  return { Rect["x"].toInt(), Rect["y"].toInt(), Rect["width"].toInt(), Rect["height"].toInt() };
}

QStringList Arguments( const VCase& i_rCase )
{
  return QStringList{ "--window", "cameras", "--source", Recording( i_rCase.pFolder ), "--time", i_rCase.pTime } +
         i_rCase.Arguments;
}

class Cameras2D : public testing::TestWithParam< VCase >
{
};

const QStringList Corrected{ "--set", "3D=true" };
const QStringList Raw{ "--set", "3D=true", "--set", "Distort3D=true" };
const QStringList Rolled{ "--set", "CameraSnap90Degrees=false" };
const VCase Cases[] = {
    { "Walking", "multicam-person/balancing", "0.5", {}, ESnapped, false, {} },
    { "Standing", "multicam-person/static", "0.1", {}, ESnapped, false, {} },
    { "Upright", "multicam-person/balancing", "0.5", { "--set", "CameraShowRotated=false" }, EUpright, false, {} },
    { "Rolled", "multicam-person/balancing", "0.5", Rolled, ERolled, false, {} },
    { "Lens", "multicam-board", "1.0", Corrected, ESnapped, true, {} },
    { "LensDrawn", "multicam-board", "1.0", Raw, ESnapped, false, {} },
    { "LensRolled", "multicam-board", "1.0", Corrected + Rolled, ERolled, true, {} },
    { "ZoomAndPan",
      "multicam-person/balancing",
      "0.5",
      { "--wheel", "100,300,120", "--drag", "500,300,541,322" },
      ESnapped,
      false,
      { 1, 0, 1, { 41, 22 } } },
    { "Ratio",
      "multicam-board",
      "1.0",
      { "--ratio", "1.5", "--drag", "500,100,541,122" },
      ESnapped,
      false,
      { 1.5, -1, 0, { 61.5, 33 } } } };
} // namespace

TEST_P( Cameras2D, TheReportTellsWhereEveryCentroidIsDrawn )
{
  HARROW_NEEDS_MODULE();
  HARROW_NEEDS_RECORDINGS();
  const VCase& rCase = GetParam();
  const QString Folder = Recording( rCase.pFolder );
  std::vector< VCamera > Seen =
      Cameras( Folder.endsWith( "board" ) ? Folder + "/camera_array.toml" : Folder + "/../calibration.toml" );
  ASSERT_EQ( Seen.size(), 4u );
  const QJsonObject Report = Render( Arguments( rCase ) + QStringList{ "--size", "1280x720" } );
  ReadSeen( rCase, Report["frame"].toObject(), Seen );
  std::vector< VTile > Tiles = LayOut( Seen, QSize( 1280, 720 ) * rCase.Hand.Ratio, rCase.Turn );
  if ( rCase.Hand.Zoomed >= 0 )
  {
    Tiles[static_cast< std::size_t >( rCase.Hand.Zoomed )].Zoom *= 1.1;
  }
  if ( rCase.Hand.Panned >= 0 )
  {
    VTile& rTile = Tiles[static_cast< std::size_t >( rCase.Hand.Panned )];
    rTile.PanX -= rCase.Hand.Drag.x() / ( rTile.Rect.width() * rTile.ScaleX * rTile.Zoom );
    rTile.PanY -= rCase.Hand.Drag.y() / ( rTile.Rect.height() * rTile.ScaleY * rTile.Zoom );
  }
  EXPECT_EQ( QJsonDocument( Report["log"].toArray() ).toJson( QJsonDocument::Compact ).toStdString(), "[]" );
  const QJsonArray Reported = Report["tiles"].toArray();
  ASSERT_EQ( Reported.size(), 4 );
  for ( int Index = 0; Index < 4; ++Index )
  {
    const VCamera& rCamera = Seen[static_cast< std::size_t >( Index )];
    const VTile& rTile = Tiles[static_cast< std::size_t >( Index )];
    EXPECT_EQ( Reported[Index]["urn"].toString(), rCamera.URN );
    EXPECT_EQ( RectOf( Reported[Index] ), rTile.Rect ) << Index;
    const QJsonArray Centroids = Reported[Index]["centroids"].toArray();
    ASSERT_EQ( static_cast< std::size_t >( Centroids.size() ), rCamera.Seen.size() );
    for ( int Point = 0; Point < Centroids.size(); ++Point )
    {
      const QPointF Expected = Place( rCamera, rTile, rCase, rCamera.Seen[static_cast< std::size_t >( Point )] );
      EXPECT_NEAR( Centroids[Point]["x"].toDouble(), Expected.x(), 0.5 ) << Index << " " << Point;
      EXPECT_NEAR( Centroids[Point]["y"].toDouble(), Expected.y(), 0.5 ) << Index << " " << Point;
      EXPECT_EQ( Centroids[Point]["index"].toInt(), Point );
    }
  }
}

INSTANTIATE_TEST_SUITE_P(, Cameras2D, testing::ValuesIn( Cases ),
                         []( const testing::TestParamInfo< VCase >& i_rInfo )
                         {
                           return std::string( i_rInfo.param.pName );
                         } );

TEST( Cameras, CentroidsAreDrawnWhereTheReportSaysAndThe3DPointsOverThem )
{
  HARROW_NEEDS_MODULE();
  HARROW_NEEDS_RECORDINGS();
  const TestSupport::VTemporaryDir Folder;
  const auto Draw = [&]( const char* i_pName, const QStringList& i_rMore, QImage& o_rPicture )
  {
    const QString Path = QString::fromStdString( ( Folder.Path() / i_pName ).string() );
    const QJsonObject Report =
        Render( Arguments( Cases[0] ) + QStringList{ "--size", "1600x900", "--output", Path } + i_rMore );
    o_rPicture = QImage( Path );
    return Report;
  };
  QImage Empty, Seen, World;
  Draw( "empty.png", { "--set", "CameraCentroids=false" }, Empty );
  const QJsonObject Report = Draw( "seen.png", {}, Seen );
  Draw( "world.png", { "--set", "CameraCentroids=false", "--set", "3D=true" }, World );
  ASSERT_EQ( Seen.size(), QSize( 1600, 900 ) );
  int Drawn = 0, Count = 0;
  for ( const QJsonValue& rTile : Report["tiles"].toArray() )
  {
    for ( const QJsonValue& rCentroid : rTile["centroids"].toArray() )
    {
      const QPoint At( static_cast< int >( rCentroid["x"].toDouble() ),
                       static_cast< int >( rCentroid["y"].toDouble() ) );
      Drawn += Seen.pixel( At ) != Empty.pixel( At ) ? 1 : 0;
      ++Count;
    }
  }
  EXPECT_GT( Count, 100 );
  EXPECT_EQ( Drawn, Count );
  // The right hip of that frame as the calibration projects it, worked out by hand from the TRC file.
  const QRect Tile = RectOf( Report["tiles"].toArray()[3] );
  EXPECT_TRUE( QRect( 0, 0, 1600, 900 ).contains( Tile ) );
  int Changed = 0;
  for ( int y = Tile.top(); y <= Tile.bottom(); ++y )
  {
    for ( int x = Tile.left(); x <= Tile.right(); ++x )
    {
      Changed += World.pixel( x, y ) != Empty.pixel( x, y ) ? 1 : 0;
    }
  }
  EXPECT_GT( Changed, 200 ) << "the markers stand in the image of the fourth camera, too";
}

TEST( Cameras, AHundredAndTwentyEightStandInOneWindow )
{
  HARROW_NEEDS_MODULE();
  const QJsonObject Report =
      Render( { "--window", "cameras", "--cameras", "128", "--time", "0.5", "--size", "1280x720" } );
  const QJsonArray Tiles = Report["tiles"].toArray();
  ASSERT_EQ( Tiles.size(), 128 );
  std::vector< QSizeF > Boxes;
  int Centroids = 0;
  QRegion Covered;
  for ( const QJsonValue& rTile : Tiles )
  {
    Boxes.emplace_back( rTile["sensorWidth"].toDouble(), rTile["sensorHeight"].toDouble() );
    Centroids += static_cast< int >( rTile["centroids"].toArray().size() );
    EXPECT_FALSE( Covered.intersects( RectOf( rTile ) ) );
    Covered += RectOf( rTile );
  }
  EXPECT_EQ( RectOf( Tiles[0] ).width(), 1280 / BestColumns( Boxes, { 1280, 720 } ) );
  EXPECT_GT( Centroids, 1000 );
  EXPECT_EQ( QJsonDocument( Report["log"].toArray() ).toJson( QJsonDocument::Compact ).toStdString(), "[]" );
}

TEST( Cameras, ADoubleClickShowsOneCameraAndAnotherOneAllAgain )
{
  HARROW_NEEDS_MODULE();
  const auto Shown = [&]( const QStringList& i_rDone )
  {
    QStringList URNs;
    const QJsonObject Report =
        Render( QStringList{ "--window", "cameras", "--cameras", "6", "--size", "900x600" } + i_rDone );
    for ( const QJsonValue& rTile : Report["tiles"].toArray() )
    {
      URNs << rTile["urn"].toString();
    }
    return URNs;
  };
  const QStringList All = Shown( {} );
  ASSERT_EQ( All.size(), 6 );
  const QStringList Last{ "--double-click", "750,450" };
  EXPECT_EQ( Shown( Last ), QStringList{ All[5] } );
  EXPECT_EQ( Shown( Last + Last ), All );
  EXPECT_EQ( Shown( { "--select", All[4] } ), QStringList{ All[4] } );
  EXPECT_EQ( Shown( { "--select", All[4], "--select", "" } ), All );
}
