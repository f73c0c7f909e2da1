#pragma once

#include "VHeldBuffer.h"
#include "VTileTable.h"

#include <MoxelGraphics/VRenderCameras.h>

#include <CoreGraphics/VRenderState.h>
#include <CoreGraphics/VShaderProgram.h>

namespace MoxelGraphics
{

/// Masks, edges, the smear of the wand and the borders of sensors in camera views: one draw a kind for all tiles.
class VTilePictures
{
public:
  VTilePictures( const VMoxelScene& i_rScene, std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider );

  /// As `VRenderCameras::SetPictures`.
  void SetPictures( std::span< const VCameraPictures > i_Pictures, double i_Frame );
  void SetFrame( double i_Frame ) { m_Frame = i_Frame; }
  /// A camera came, went or has another sensor.
  void CamerasChanged() { ++m_CamerasGeneration; }

  void Collect( const CoreGraphics::VRenderContext& i_rContext, const VSceneOptions& i_rOptions );
  /// What lies under the grey, and what lies over it; in this order.
  void DrawUnder( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions );
  void DrawOver( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions );

private:
  /// A rectangle of the sensor's pixels.
  struct VRectangle
  {
    std::uint16_t Left = 0, Top = 0, Right = 0, Bottom = 0; ///< edges of pixels
    std::uint32_t Colour = 0;                               ///< RGBA in memory
    float Tile = 0;
  };
  /// A place on the sensor; `Value` is grey, or a frame.
  struct VSpot
  {
    float X = 0, Y = 0, Value = 0;
    float Tile = 0;
  };
  template < typename T >
  struct VList
  {
    std::vector< T > Items;
    VHeldBuffer Buffer;
    std::uint64_t MadeOf = 0;
    std::uint64_t Generation = 0;
  };
  struct VLook
  {
    std::shared_ptr< CoreGraphics::VShaderProgram > pProgram;
    CoreGraphics::VUniform Table{ "t_Tiles" }, Show{ "u_ShowSelection" }, Frame{ "u_FrameNumber" };
  };

  bool Wants( const VSceneOptions& i_rOptions, int i_RenderMode ) const;
  bool Use( CoreGraphics::VRenderContext& io_rContext, VLook& io_rLook );
  static VRectangle CellOf( const CoreMoxelTypes::VCameraMaskGrid& i_rMask, std::size_t i_Cell );
  void MakeMasks();
  void MakeCellIds( VList< VRectangle >& io_rList, int i_RenderMode );
  void MakeEdges();
  void MakeWand();
  void MakeBorders();
  void DrawRectangles( CoreGraphics::VRenderContext& io_rContext, VLook& io_rLook, VList< VRectangle >& io_rList,
                       bool i_bOutline );
  void DrawSpots( CoreGraphics::VRenderContext& io_rContext, VLook& io_rLook, VList< VSpot >& io_rList );

  const VMoxelScene& m_rScene;
  const std::shared_ptr< const ZEK::IRenderCameraProvider > m_pProvider;
  VTileTable m_Tiles;
  CoreGraphics::VTexelBuffer* m_pTable = nullptr; ///< of the tiles that are being drawn
  std::vector< VCameraPictures > m_Pictures;
  std::vector< VMarkedCell > m_MarkedCells; ///< of the camera whose cells can be picked
  std::size_t m_Edited = 0;                 ///< its number, or past the cameras
  double m_Frame = 0;
  std::uint64_t m_CamerasGeneration = 1;
  std::uint64_t m_MasksGeneration = 1, m_EdgesGeneration = 1, m_WandGeneration = 1, m_CellsGeneration = 1;
  VList< VRectangle > m_Masks, m_Cells, m_Marked, m_Borders;
  VList< VSpot > m_Edges, m_Wand;
  VLook m_Mask, m_MaskSelection, m_Edge, m_WandLook;
  CoreGraphics::VStaticBuffer m_Square, m_Outline;
  CoreGraphics::VRenderState m_BlendState, m_IdState;
};

} // namespace MoxelGraphics
