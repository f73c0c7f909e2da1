#pragma once

#include <Flow2Graphics/IFlowRenderType.h>

#include <MoxelGraphics/IRenderType.h>
#include <MoxelGraphics/VSphereHelper.h>

#include <array>
#include <map>
#include <memory>
#include <string>
#include <vector>

namespace CoreMoxelTypes
{
struct VGeometrySet;
}

namespace MoxelGraphics
{
class VMoxelScene;
}

namespace Flow2Graphics
{

/// Points, lines and translucent triangles that a frame brings by name, each set in its colour. Everything of one kind
/// is one draw. None of it can be selected. Indices past the points of their set, and points that are no place, draw
/// nothing.
class VFlowRenderGeometry : public MoxelGraphics::IRenderType, public IFlowRenderType
{
public:
  /// One corner of a line or a triangle.
  struct VCorner
  {
    std::array< float, 3 > Position{}; ///< mm
    std::uint32_t Colour = 0;          ///< 0xAABBGGRR
  };

  /// The scene owns this object.
  explicit VFlowRenderGeometry( MoxelGraphics::VMoxelScene& i_rScene );
  ~VFlowRenderGeometry() override;

  void Update( const ZEK::IFlowState& i_rState ) override;
  void Render( CoreGraphics::VRenderContext& io_rContext, const MoxelGraphics::VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override;

  /// The sets of the frame by name; of several of one name the last.
  const std::map< std::string, ZEK::VFlowItemRef >& Sets() const { return m_Sets; }
  const MoxelGraphics::VSphereBatch& Points() const { return m_Points; }
  const std::vector< VCorner >& Lines() const { return m_Lines; }         ///< two a line
  const std::vector< VCorner >& Triangles() const { return m_Triangles; } ///< three a triangle

private:
  struct VGl;
  bool IsAsHeld( const ZEK::IFlowState& i_rState ) const;
  void Rebuild();
  void Append( const CoreMoxelTypes::VGeometrySet& i_rSet );

  MoxelGraphics::VMoxelScene& m_rScene;
  std::vector< ZEK::VFlowItemRef > m_Held; ///< in the order of the state
  std::map< std::string, ZEK::VFlowItemRef > m_Sets;
  std::vector< MoxelGraphics::VScenePoint > m_Places;
  std::vector< std::uint32_t > m_Colours;
  MoxelGraphics::VSphereBatch m_Points;
  std::vector< VCorner > m_Lines, m_Triangles;
  std::uint64_t m_Generation = 1;
  std::unique_ptr< VGl > m_pGl;
};

} // namespace Flow2Graphics
