#include "TileLayout.h"

#include <MoxelGraphics/VCameraDefinition.h>

#include <algorithm>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
constexpr double LeastPixelAspect = 0.01, GreatestPixelAspect = 100.0;

int DivideUp( int i_Value, int i_By )
{
  return ( i_Value + i_By - 1 ) / i_By;
}

/// How far an image of that aspect fills a cell; the sum over the tiles.
double Fill( const VCameraTiles& i_rTiles, double i_CellAspect )
{
  double Sum = 0.0;
  for ( const VCameraTile& rTile : i_rTiles )
  {
    const double Aspect = rTile.RotatedAspect;
    Sum += std::min( i_CellAspect, Aspect ) / std::max( i_CellAspect, Aspect );
  }
  return Sum;
}

/// From parts of the image's width and height to parts of its cell, so that all of the image is seen.
void FitImage( VCameraTile& io_rTile, double i_CellAspect )
{
  const bool bImage = io_rTile.RotatedWidth > 0 && io_rTile.RotatedHeight > 0;
  // Views count in widths and heights of the image: what stands in for a pixel there is as wide as the whole image.
  const double ImageAspect =
      bImage ? io_rTile.PixelAspect * io_rTile.ImageWidth / io_rTile.ImageHeight : io_rTile.PixelAspect;
  double X = 1.0, Y = 1.0;
  if ( io_rTile.RotatedAspect <= i_CellAspect )
  {
    const double Part = bImage ? io_rTile.ImageHeight / io_rTile.RotatedHeight : 1.0;
    X = ImageAspect / i_CellAspect * Part;
    Y = Part;
  }
  else
  {
    const double Part = bImage ? io_rTile.ImageWidth / io_rTile.RotatedWidth : 1.0;
    X = Part;
    Y = i_CellAspect / ImageAspect * Part;
  }
  io_rTile.ScaleX = static_cast< float >( X );
  io_rTile.ScaleY = static_cast< float >( Y );
}
} // namespace

VCameraTile MakeImageTile( const VCameraDefinition& i_rCamera )
{
  VCameraTile Tile;
  Tile.DeviceURN = QString::fromStdString( i_rCamera.DeviceURN );
  Tile.DisplayType = QString::fromStdString( i_rCamera.DisplayType );
  Tile.UserId = i_rCamera.UserId;
  Tile.Position = i_rCamera.Position;
  const double Aspect = i_rCamera.PixelAspect;
  Tile.PixelAspect = Aspect >= LeastPixelAspect && Aspect <= GreatestPixelAspect ? Aspect : 1.0;
  Tile.bVideo = i_rCamera.bVideo;
  Tile.ImageWidth = i_rCamera.ImageWidth;
  Tile.ImageHeight = i_rCamera.ImageHeight;
  Tile.Rotation = i_rCamera.Rotation;
  Tile.SnappedRotation = i_rCamera.SnappedRotation;
  return Tile;
}

void MeasureRotated( VCameraTile& io_rTile, bool i_bRotated, bool i_bSnapped )
{
  static constexpr std::array< float, 4 > Identity{ 1, 0, 0, 1 };
  const std::array< float, 4 >& rTurn = !i_bRotated  ? Identity
                                        : i_bSnapped ? io_rTile.SnappedRotation
                                                     : io_rTile.Rotation;
  const double W = io_rTile.ImageWidth, H = io_rTile.ImageHeight;
  // The box of the four corners: (0, 0), (W, 0), (0, H) and their sum.
  const double Width = std::abs( rTurn[0] * W ) + std::abs( rTurn[1] * H );
  const double Height = std::abs( rTurn[2] * W ) + std::abs( rTurn[3] * H );
  const bool bImage = W > 0 && H > 0 && std::isfinite( Width ) && std::isfinite( Height ) && Width > 0 && Height > 0;
  io_rTile.RotatedWidth = bImage ? Width : 0.0;
  io_rTile.RotatedHeight = bImage ? Height : 0.0;
  io_rTile.RotatedAspect = bImage ? Width / Height : 1.0;
}

VGridShape ChooseShape( const VCameraTiles& i_rTiles, QSize i_Frame )
{
  const int Count = static_cast< int >( i_rTiles.size() );
  if ( Count == 0 )
  {
    return {};
  }
  double Best = 0.0;
  int BestRows = 1;
  for ( int Rows = 1; Rows <= Count; ++Rows )
  {
    const int Columns = DivideUp( Count, Rows );
    const int Width = i_Frame.width() / Columns, Height = i_Frame.height() / Rows;
    const bool bLastRowEmpty = Columns * Rows - Count >= Columns;
    if ( bLastRowEmpty || Width <= 0 || Height <= 0 )
    {
      continue;
    }
    const double Score = Fill( i_rTiles, static_cast< double >( Width ) / Height ) / ( Columns * Rows );
    if ( Score > Best )
    {
      Best = Score;
      BestRows = Rows;
    }
  }
  return { DivideUp( Count, BestRows ), BestRows };
}

void PlaceTiles( VCameraTiles& io_rTiles, QSize i_Frame, VGridShape i_Shape )
{
  const int Width = i_Frame.width() / i_Shape.Columns, Height = i_Frame.height() / i_Shape.Rows;
  // A frame with fewer pixels than columns or rows has no cell that anything could be seen in.
  const double CellAspect = Width > 0 && Height > 0 ? static_cast< double >( Width ) / Height : 1.0;
  for ( std::size_t Index = 0; Index < io_rTiles.size(); ++Index )
  {
    VCameraTile& rTile = io_rTiles[Index];
    const int Column = static_cast< int >( Index ) % i_Shape.Columns;
    const int Row = i_Shape.Rows - static_cast< int >( Index ) / i_Shape.Columns - 1;
    const bool bTop = Row == i_Shape.Rows - 1;
    rTile.Rect =
        QRect( Column * Width, Row * Height, Width, bTop ? i_Frame.height() - ( i_Shape.Rows - 1 ) * Height : Height );
    rTile.Viewport = rTile.Rect;
    FitImage( rTile, CellAspect );
  }
}

} // namespace MoxelGraphics
