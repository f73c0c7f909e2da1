#pragma once

#include <MoxelGraphics/IRenderType.h>

#include <array>
#include <cstdint>
#include <memory>
#include <span>
#include <vector>

namespace MoxelGraphics
{
class VMoxelScene;

/// One force plate. `Model` takes a cube of side 1 about the origin to the plate's body: its face at z = 0.5 to the
/// surface, the other to the underside. Column-major, right-handed, mm.
struct VForcePlate
{
  std::array< float, 16 > Model{};
  std::uint32_t Colour = 0; ///< 0xAABBGGRR
};

/// What one plate feels.
struct VPlateLoad
{
  std::array< float, 3 > Force{};  ///< on the body, world axes, N
  std::array< float, 3 > Centre{}; ///< of pressure, in the world, mm
};

/// Force plates as thin boxes. On a loaded one a cross of lines runs through the centre of pressure, and an arrow
/// stands on it: along the force on the body, half a millimetre a newton.
///
/// Plates, loads and ids are set apart: ids anew with every state, the others when they changed. Plates that carry
/// nothing are one draw, all arrows are one; each loaded plate is a draw of its own.
class VRenderForcePlates : public IRenderType
{
public:
  /// The scene owns this object.
  explicit VRenderForcePlates( VMoxelScene& i_rScene );
  ~VRenderForcePlates() override;

  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override;

  /// Corners in order around the surface, mm in the world. False, with nothing written, when they span no area or are
  /// not finite numbers of less than a thousand kilometres. The underside lies `i_Thickness` below the surface, as
  /// the up axis has it.
  static bool MakeModel( const std::array< std::array< double, 3 >, 4 >& i_rCorners, double i_Thickness, bool i_bYUp,
                         std::array< float, 16 >& o_rModel );
  /// The transform of the arrow mesh, or false for a load that shows none: 25 N or less, or not finite.
  static bool MakeArrow( const VPlateLoad& i_rLoad, std::array< float, 16 >& o_rModel );

  void SetPlates( std::span< const VForcePlate > i_Plates );
  /// As many as there are plates; others are ignored.
  void SetLoads( std::span< const VPlateLoad > i_Loads );
  /// Plate i has `i_FirstId` + i, or none of them when it is 0. `i_Flags` is empty, or holds for each plate the bits of
  /// its word from EIdSelected up, shifted down by 21.
  void SetIds( std::uint32_t i_FirstId, std::span< const std::uint8_t > i_Flags );

  std::span< const VForcePlate > Plates() const { return m_Plates; }
  std::span< const VPlateLoad > Loads() const { return m_Loads; }
  std::uint32_t FirstId() const { return m_FirstId; }
  /// Transforms of the arrows that are shown.
  std::span< const VForcePlate > Arrows() const { return m_Arrows; }

protected:
  VMoxelScene& m_rScene;

private:
  struct VGl;
  void RenderVisible( CoreGraphics::VRenderContext& io_rContext );
  void RenderLoaded( CoreGraphics::VRenderContext& io_rContext, std::size_t i_Plate );
  void RenderUnloaded( CoreGraphics::VRenderContext& io_rContext, std::size_t i_First, std::size_t i_End );
  void RenderArrows( CoreGraphics::VRenderContext& io_rContext );
  void RenderIds( CoreGraphics::VRenderContext& io_rContext );

  std::vector< VForcePlate > m_Plates;
  std::vector< VPlateLoad > m_Loads;   ///< as many as plates; no force where nothing is shown
  std::vector< VForcePlate > m_Arrows; ///< as many as loaded plates
  std::vector< std::uint8_t > m_Flags;
  std::uint32_t m_FirstId = 0;
  bool m_bFlagged = false; ///< flags were given, be they 0
  bool m_bMarked = false;
  std::uint64_t m_PlatesGeneration = 1;
  std::uint64_t m_ArrowsGeneration = 1;
  std::uint64_t m_FlagsGeneration = 1;
  std::unique_ptr< VGl > m_pGl;
};

} // namespace MoxelGraphics
