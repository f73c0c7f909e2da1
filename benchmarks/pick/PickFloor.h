#pragma once

#include "SceneSetup.h"

#include <QtGui/QMatrix4x4>

#include <cstdint>
#include <memory>
#include <vector>

namespace PickBench
{

/// The least that picks among the same spheres: one buffer of instances, each a square across the line of sight whose
/// fragments outside of the circle are thrown away, drawn once for the picture and once for the pick.
class VPickFloor
{
public:
  /// The matrices are those of the view that it is compared with.
  VPickFloor( const SceneBench::VPopulation& i_rPopulation, const QMatrix4x4& i_rView,
              const QMatrix4x4& i_rProjection );
  ~VPickFloor();

  /// Draws the frame's picture into the current target.
  void Draw( int i_Frame );
  /// The id nearest to the middle of the 11 by 11 pixels around a point, y up; 0 for none. 1 is the first sphere.
  std::uint32_t Point( int i_X, int i_Y );
  /// At half the size, layer after layer with what was found left out, until a layer finds nothing new; then every
  /// centre against the rectangle, in pixels, y up. The ids that were found.
  const std::vector< std::uint32_t >& Band( int i_Left, int i_Bottom, int i_Right, int i_Top );

private:
  struct VGl;
  void Submit( bool i_bPick, std::size_t i_Count );
  std::size_t WriteUnfound();
  void FindCentres( float i_Left, float i_Bottom, float i_Right, float i_Top );
  void Find( std::uint32_t i_Id );
  std::unique_ptr< VGl > m_pGl;
};

} // namespace PickBench
