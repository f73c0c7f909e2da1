#include "SubjectInstances.h"

namespace MoxelGraphics
{
using namespace CoreGraphics;

static_assert( sizeof( VInstance< VScenePoint > ) == 20 && sizeof( VInstance< VColumns > ) == 52 &&
               sizeof( VInstance< VEnds > ) == 28 );

const VVertexLayout& SeenPlaceLayout()
{
  static constexpr VVertexLayout Layout( 20, 1,
                                         { { EAttributeTargetPosAndSize, 4, GL_FLOAT, false, 0 },
                                           { EAttributeReconPosAndSize, 4, GL_FLOAT, false, 0 },
                                           { EAttributeModelColour, 4, GL_UNSIGNED_BYTE, true, 16 } } );
  return Layout;
}

const VVertexLayout& PickedPlaceLayout()
{
  static constexpr VVertexLayout Layout( 20, 1,
                                         { { EAttributeTargetPosAndSize, 4, GL_FLOAT, false, 0 },
                                           { EAttributeReconPosAndSize, 4, GL_FLOAT, false, 0 },
                                           { EAttributeInstanceFlags, 1, GL_UNSIGNED_INT, false, 16 } } );
  return Layout;
}

const VVertexLayout& SeenColumnsLayout()
{
  static constexpr VVertexLayout Layout( 52, 1,
                                         { { EAttributeModelTransform, 12, GL_FLOAT, false, 0 },
                                           { EAttributeModelColour, 4, GL_UNSIGNED_BYTE, true, 48 } } );
  return Layout;
}

const VVertexLayout& PickedColumnsLayout()
{
  static constexpr VVertexLayout Layout( 52, 1,
                                         { { EAttributeModelTransform, 12, GL_FLOAT, false, 0 },
                                           { EAttributeInstanceFlags, 1, GL_UNSIGNED_INT, false, 48 } } );
  return Layout;
}

const VVertexLayout& PickedEndsLayout()
{
  static constexpr VVertexLayout Layout( 28, 1,
                                         { { EAttributeStickA, 3, GL_FLOAT, false, 0 },
                                           { EAttributeStickB, 3, GL_FLOAT, false, 12 },
                                           { EAttributeInstanceFlags, 1, GL_UNSIGNED_INT, false, 24 } } );
  return Layout;
}

VRenderState SolidState()
{
  VRenderState State;
  State.cullMode = ECullBack;
  State.depthFunction = EDepthLessOrEqual;
  return State;
}

VRenderState BlendedState()
{
  VRenderState State = SolidState();
  State.colourBlend = EColourBlendAlpha;
  return State;
}

} // namespace MoxelGraphics
