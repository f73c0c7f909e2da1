#pragma once

#include <cstdint>

namespace CoreGraphics
{

/// What the current frame draws for; the value of `VRenderContext::RenderMode`.
enum ERenderMode : int
{
  ERenderModeNormal = 0,
  ERenderModeSelection = 1,
  ERenderModeHighlight = 2
};

/// Blending of the colour channels. Any other number stands for (GL_ONE, GL_ZERO).
enum EColourBlend : int
{
  EColourBlendNone = 0,
  EColourBlendAlpha = 1,         ///< GL_SRC_ALPHA, GL_ONE_MINUS_SRC_ALPHA
  EColourBlendAdd = 2,           ///< GL_SRC_ALPHA, GL_ONE
  EColourBlendConstant = 3,      ///< GL_CONSTANT_ALPHA, GL_ONE
  EColourBlendPremultiplied = 4, ///< GL_ONE, GL_ONE_MINUS_SRC_ALPHA
};

/// Blending of the alpha channel. Any other number stands for (GL_ONE, GL_ZERO).
enum EAlphaBlend : int
{
  EAlphaBlendKeep = 0, ///< GL_ZERO, GL_ONE: the target keeps its alpha
  EAlphaBlendAdd = 1,  ///< GL_ONE, GL_ONE
  EAlphaBlendReplace = 2
};

enum ECullMode : int
{
  ECullNone = 0,
  ECullFront = 1,
  ECullBack = 2
};

enum EDepthFunction : int
{
  EDepthLess = 0,
  EDepthLessOrEqual = 1,
  EDepthGreater = 2,
  EDepthGreaterOrEqual = 3,
  EDepthNotEqual = 4,
  EDepthEqual = 5
};

/// The fixed-function state of a draw: filled once by a render type, handed to `VRenderContext::SetRenderState`.
/// Blending is off only when both blend fields are 0.
struct VRenderState
{
  int colourBlend = EColourBlendNone;
  int alphaBlend = EAlphaBlendKeep;
  int cullMode = ECullNone;
  int depthFunction = EDepthLess;
  float blendConstant = 1.0f;
  bool depthTest = true;
  bool depthWrite = true;
  bool colourWrite = true;

  bool operator==( const VRenderState& ) const = default;
};

enum EMinFilter : int
{
  EMinNearestMipmapNearest = 0,
  EMinLinearMipmapNearest = 1,
  EMinLinearMipmapLinear = 2,
  EMinNearest = 3
};

/// How a 2D texture is sampled. A texture without mipmaps needs `EMinNearest`.
struct VTextureSampling
{
  int minFilter = EMinLinearMipmapLinear;
  bool magnifyLinear = true;
  bool clampS = true;
  bool clampT = true;
};

} // namespace CoreGraphics
