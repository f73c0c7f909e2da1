#pragma once

#include "GreyscaleStretch.h"

#include <MoxelGraphics/CameraDistortion.h>

#include <CoreGraphics/VRenderState.h>
#include <CoreGraphics/VVertexBuffer.h>

#include <QtCore/QPointer>
#include <QtCore/QRect>
#include <QtCore/QString>
#include <QtGui/QOpenGLContextGroup>
#include <QtGui/QVector4D>

#include <cstdint>
#include <map>
#include <memory>
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

/// The grey of cameras with the image stretched to where there was some: a point a grey pixel, a draw a tile.
class VMaximisedGreyscale
{
public:
  VMaximisedGreyscale( VMoxelScene& i_rScene, std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider );
  ~VMaximisedGreyscale();

  void Collect( const CoreGraphics::VRenderContext& i_rContext, const VSceneOptions& i_rOptions );
  void Forget() { m_Collected = m_Last = 0; }
  /// Once more the tiles of the last `DrawTiles`.
  void Again() { m_Collected = m_Last; }
  void DrawTiles( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions );

private:
  struct VTile
  {
    QString Text; ///< the name as the view has it, and as the provider does
    std::string Camera;
    QVector4D View2D;
    QRect Rect;
  };
  /// One row of floats as a texture. False for more than the device takes.
  class VMap
  {
  public:
    VMap() = default;
    ~VMap();
    VMap( const VMap& ) = delete;
    VMap& operator=( const VMap& ) = delete;
    bool Write( CoreGraphics::VRenderContext& io_rContext, int i_Unit, const std::vector< float >& i_rPlaces );
    bool Bind( CoreGraphics::VRenderContext& io_rContext, int i_Unit ) const;

  private:
    GLuint m_Texture = 0;
    QPointer< QOpenGLContextGroup > m_pGroup;
  };
  /// What is kept of one camera.
  struct VCamera
  {
    VGreyscaleStretch Stretch;
    VMap Columns, Rows;
    CoreGraphics::VDynamicBuffer Points, Words;
    std::uint64_t Taken = 0; ///< generation of the lists that the history had last
    std::uint64_t Drawn = 0; ///< generation of the lists that the points are of
    int History = 0;         ///< as the maps were made
    double Factor = 0;
    bool bRefused = false; ///< the device does not take the maps
    /// Of the provider, and of the lists: what the words are of; 0: to be written anew.
    std::uint64_t WordsProvider = 0, WordsDrawn = 0;
    float Scale = 1; ///< how much larger than a pixel of the image a point is
    int Count = 0;
  };

  void DrawTile( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions, const VTile& i_rTile );
  bool Take( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions, VCamera& io_rCamera,
             const ZEK::IRenderCamera& i_rCamera, const ZEK::VCameraLists2D& i_rLists );
  bool WriteMaps( CoreGraphics::VRenderContext& io_rContext, VCamera& io_rCamera, const std::string& i_rName );
  static bool WritePoints( VCamera& io_rCamera, const ZEK::VGreyscaleData& i_rData );
  bool WriteWords( VCamera& io_rCamera, const ZEK::IRenderCamera& i_rCamera, const ZEK::VGreyscaleData& i_rData );
  void DropGone();

  VMoxelScene& m_rScene;
  const std::shared_ptr< const ZEK::IRenderCameraProvider > m_pProvider;
  std::vector< VTile > m_Tiles; ///< only the first m_Collected are of this walk
  std::size_t m_Collected = 0;
  std::size_t m_Last = 0;
  std::map< std::string, VCamera, std::less<> > m_Cameras;
  std::vector< std::uint32_t > m_Words;
  std::shared_ptr< CoreGraphics::VShaderProgram > m_pNormal, m_pSelection;
  VSensorUniforms m_NormalSensor, m_SelectionSensor;
  CoreGraphics::VUniform m_NormalImage{ "u_MapOffsetScale" }, m_SelectionImage{ "u_MapOffsetScale" };
  CoreGraphics::VUniform m_MapX{ "t_MapX" }, m_MapY{ "t_MapY" }, m_Show{ "u_ShowSelection" };
  CoreGraphics::VRenderState m_State;
};

} // namespace MoxelGraphics
