#pragma once

#include <MoxelGraphics/VCameraTile.h>

#include <QtCore/QSize>

namespace MoxelGraphics
{
struct VCameraDefinition;

struct VGridShape
{
  int Columns = 1;
  int Rows = 1;
  friend bool operator==( const VGridShape&, const VGridShape& ) = default;
};

/// The camera's image, not measured and without a place. A pixel aspect that no sensor has counts as 1.
VCameraTile MakeImageTile( const VCameraDefinition& i_rCamera );
/// The bounding box of the tile's image as it stands on screen.
void MeasureRotated( VCameraTile& io_rTile, bool i_bRotated, bool i_bSnapped );
/// The shape in which the tiles' images waste the least of a frame; the one with fewer rows of equal ones.
VGridShape ChooseShape( const VCameraTiles& i_rTiles, QSize i_Frame );
/// The first tile stands at the top left. Where the frame cannot be parted evenly the top row is higher and the
/// right edge stays free.
void PlaceTiles( VCameraTiles& io_rTiles, QSize i_Frame, VGridShape i_Shape );

} // namespace MoxelGraphics
