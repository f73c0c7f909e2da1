#pragma once

#include <MoxelGraphics/CameraDistortion.h>

#include <CoreGraphics/VTexelBuffer.h>
#include <CoreGraphics/VVertexBuffer.h>
#include <ZEK/RenderCamera.h>

#include <QtCore/QRect>
#include <QtCore/QString>
#include <QtGui/QVector4D>

#include <array>
#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <vector>

namespace CoreGraphics
{
class VRenderContext;
}

namespace MoxelGraphics
{
class VMoxelScene;
struct VSceneOptions;

/// What is kept of one camera in a set of buffers.
struct VTileSlot
{
  std::string Name;
  std::uint64_t Generation = 0; ///< of the lists that were written
  std::uint32_t First = 0;      ///< objects
  std::uint32_t Count = 0;
  float Largest = 0;                          ///< radius, sensor pixels
  std::array< float, 4 > Image{ 0, 0, 1, 1 }; ///< from image to sensor pixels: offset, scale
};

/// Buffers with the objects of several cameras; what they hold is the business of the kind.
struct VTileSet
{
  virtual ~VTileSet() = default;

  std::vector< VTileSlot > Slots;
  std::size_t SlotCount = 0;
  std::uint64_t Serial = 0; ///< grows with each writing; 0: nothing was written
  std::uint64_t Used = 0;
};

/// One kind of object of the tiles of camera views: collects the tiles of a view as they come by, and sees to it that
/// what they show stands in one set of buffers, and where they show it in one table. A set is written when a camera's
/// lists have another generation, a table when the view moved; the same state again touches neither. A view that shows
/// some of another's cameras draws from the other's set.
class VTileBatch
{
public:
  /// Objects First up to End of the set, and among them those that may be at least `LargePixels` wide.
  struct VDraw
  {
    VTileSet* pSet = nullptr;
    CoreGraphics::VTexelBuffer* pTable = nullptr;
    std::uint32_t First = 0, End = 0;
    std::uint32_t LargeFirst = 0, LargeEnd = 0;
    bool bSmall = false; ///< some may be smaller
  };
  static constexpr float LargePixels = 2.0f;

  explicit VTileBatch( std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider, bool i_bGreyscale );
  virtual ~VTileBatch();

  void Collect( const CoreGraphics::VRenderContext& i_rContext, const VSceneOptions& i_rOptions );
  bool IsEmpty() const { return m_Collected == 0; }
  void Forget() { m_Collected = m_Last = 0; }
  /// What to draw for the tiles since the last call; false for nothing.
  bool Prepare( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions, VDraw& o_rDraw );
  /// Once more the tiles of the last `Prepare`.
  void Again() { m_Collected = m_Last; }
  /// The buffers turned out to be gone: the next `Prepare` writes everything anew.
  void Invalidate();

protected:
  virtual std::unique_ptr< VTileSet > MakeSet() const = 0;
  /// Writes the slots' lists into the set's buffers and fills in what a slot says of them.
  virtual bool Write( CoreGraphics::VRenderContext& io_rContext, VTileSet& io_rSet,
                      std::span< const ZEK::VCameraLists2D > i_Lists ) = 0;

  const std::shared_ptr< const ZEK::IRenderCameraProvider > m_pProvider;
  const bool m_bGreyscale;

private:
  static constexpr std::uint32_t NoSlot = 0xFFFFFFFF;
  /// Texels of the table for one camera, of four floats.
  static constexpr std::size_t RowFloats = 32;
  static constexpr std::size_t MostViews = 6, MostSets = 3;

  struct VTile
  {
    QString Camera;
    QVector4D View2D;
    QRect Rect;
  };
  /// All that a view's table and set are made of beside its tiles.
  struct VKey
  {
    std::uint64_t Provider = 0; ///< its generation
    QRect Frame;
    int ColourScheme = 0;
    bool bDistort = false, bRotated = false, bSnapped = false;

    friend bool operator==( const VKey&, const VKey& ) = default;
  };
  struct VView
  {
    std::vector< VTile > Tiles;
    std::vector< std::string > Names;   ///< by tile
    std::vector< std::uint32_t > Slots; ///< by tile
    VKey Key;
    int Set = -1;
    std::uint64_t SetSerial = 0;
    std::vector< float > Rows; ///< as the table holds them
    CoreGraphics::VTexelBuffer Table{ CoreGraphics::ETexelFloats };
    VDraw Draw;
    std::uint64_t Used = 0;
  };

  static bool SamePlace( const VTile& i_rA, const VTile& i_rB );
  bool SameTiles( const VView& i_rView ) const;
  VView& FindView( bool& o_rbSame );
  bool FindLists( VView& io_rView, const VSceneOptions& i_rOptions );
  bool FindSet( VView& io_rView );
  bool Matches( VView& io_rView, const VTileSet& i_rSet ) const;
  VTileSet& SetToWrite( VView& io_rView );
  bool WriteSet( CoreGraphics::VRenderContext& io_rContext, VView& io_rView );
  bool WriteTable( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions, VView& io_rView );
  void Place( VView& io_rView, const VTileSet& i_rSet, std::size_t i_Tile, const VSceneOptions& i_rOptions );

  std::vector< VTile > m_Tiles;
  std::size_t m_Collected = 0;
  std::size_t m_Last = 0; ///< tiles of the last `Prepare`
  std::vector< std::unique_ptr< VView > > m_Views;
  std::vector< std::unique_ptr< VTileSet > > m_Sets;
  std::vector< ZEK::VRenderCameraRef > m_Cameras; ///< by tile, while a view is prepared
  std::vector< ZEK::VCameraLists2D > m_Lists;     ///< by tile, then by slot
  ZEK::VDrawWords m_Colours;
  std::vector< float > m_NewRows;
  std::uint64_t m_Clock = 0;
  std::uint64_t m_Serial = 0;
};

/// The square that instances of a quad are drawn from: four corners, 0 to 1, for a strip.
class VUnitSquare
{
public:
  VUnitSquare();
  CoreGraphics::VVertexStream Stream();

private:
  CoreGraphics::VStaticBuffer m_Corners;
};

/// Seldom looks at the letters of texts that are the same.
bool SameText( const QString& i_rA, const QString& i_rB );

/// Whether something of that kind is selected or lies under the pointer.
bool HasMarks( VMoxelScene& i_rScene, std::uint32_t i_Kind );

} // namespace MoxelGraphics
