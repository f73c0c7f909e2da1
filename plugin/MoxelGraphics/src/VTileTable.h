#pragma once

#include <CoreGraphics/VTexelBuffer.h>
#include <ZEK/RenderCamera.h>

#include <QtCore/QRect>
#include <QtCore/QString>
#include <QtGui/QVector4D>

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace CoreGraphics
{
class VRenderContext;
}

namespace MoxelGraphics
{
struct VSceneOptions;

/// Where the cameras of a view's tiles stand in the frame: a table with a row for each camera of the provider, by its
/// number, that programs place what belongs to the camera by. The row of a camera without a tile places everything out
/// of sight. The same view again touches no table; several views have one each.
class VTileTable
{
public:
  explicit VTileTable( std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider );

  void Collect( const CoreGraphics::VRenderContext& i_rContext, const VSceneOptions& i_rOptions );
  bool IsEmpty() const { return m_Collected == 0; }
  void Forget() { m_Collected = m_Last = 0; }
  /// Once more the tiles of the last `Prepare`.
  void Again() { m_Collected = m_Last; }
  /// The table of the tiles since the last call; null for none.
  CoreGraphics::VTexelBuffer* Prepare( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions );

private:
  static constexpr std::size_t RowFloats = 32; ///< eight texels
  static constexpr std::size_t MostViews = 6;

  struct VTile
  {
    QString Camera;
    QVector4D View2D;
    QRect Rect;
  };
  struct VKey
  {
    std::uint64_t Provider = 0;
    QRect Frame;
    bool bDistort = false, bRotated = false, bSnapped = false;

    friend bool operator==( const VKey&, const VKey& ) = default;
  };
  struct VView
  {
    std::vector< VTile > Tiles;
    std::vector< std::string > Names;
    VKey Key;
    std::vector< float > Rows;
    CoreGraphics::VTexelBuffer Table{ CoreGraphics::ETexelFloats };
    std::uint64_t Used = 0;
  };

  VView& FindView( bool& o_rbSame );
  void MakeRows( const VView& i_rView, const VSceneOptions& i_rOptions );
  static bool Write( CoreGraphics::VRenderContext& io_rContext, VView& io_rView, const std::vector< float >& i_rRows );

  const std::shared_ptr< const ZEK::IRenderCameraProvider > m_pProvider;
  std::vector< VTile > m_Tiles;
  std::size_t m_Collected = 0;
  std::size_t m_Last = 0; ///< tiles of the last `Prepare`
  std::vector< std::unique_ptr< VView > > m_Views;
  std::vector< float > m_NewRows;
  std::uint64_t m_Clock = 0;
};

} // namespace MoxelGraphics
