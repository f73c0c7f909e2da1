#pragma once

#include "VTexture.h"

#include <CoreMoxelTypes/Camera.h>
#include <CoreVideoUtils/VideoPlanes.h>
#include <ZEK/Result.h>

#include <QtCore/QString>
#include <QtGui/QVector2D>

#include <array>
#include <cstdint>
#include <vector>

namespace MoxelGraphics
{

/// The planes of one camera's newest video frame on the GPU, as the video programs read them.
class VVideoTextures
{
public:
  /// Writes the frame unless it is the one that is held. Fails as `CoreVideoUtils::FindPlanes` does, and with
  /// `NotSupported` for a frame larger than the device takes; there is then nothing to draw.
  ZEK::IResult Take( CoreGraphics::VRenderContext& io_rContext, const CoreMoxelTypes::VVideoFrame& i_rFrame );
  void Free();

  /// To units 0, 1 and 2.
  void Bind( CoreGraphics::VRenderContext& io_rContext ) const;
  /// Of the frame that was taken; its data are held.
  const CoreMoxelTypes::VVideoFrame& Frame() const { return m_Frame; }
  /// Columns of the picture as the textures hold them: packed pixels come in pairs.
  std::uint32_t TextureColumns() const;
  /// The part of the chroma planes that lies beyond the picture.
  QVector2D ChromaTrim() const;
  /// By all frames so far.
  std::uint64_t BytesWritten() const { return m_BytesWritten; }

private:
  bool IsHeld( const CoreGraphics::VRenderContext& i_rContext, const CoreMoxelTypes::VVideoFrame& i_rFrame ) const;

  std::array< VTexture, 3 > m_Textures;
  CoreMoxelTypes::VVideoFrame m_Frame;
  ZEK::IResult m_Result = ZEK::IResult::NotSet;
  std::uint64_t m_BytesWritten = 0;
};

/// The images of one camera's set that a search finds, each on the GPU from when it is first to be seen.
class VImageTextures
{
public:
  /// Looks for the tags that contain the expression, whatever their case; all for an empty one. Does nothing for the
  /// set and the expression that are held. Images that cannot be shown are logged and left out.
  void Take( CoreGraphics::VRenderContext& io_rContext, const CoreMoxelTypes::VImageSet& i_rSet, std::uint64_t i_Id,
             const QString& i_rExpression );
  void Free();
  /// The textures to draw, in the order of the set.
  const std::vector< const VTexture* >& Found() const { return m_Found; }
  std::uint64_t BytesWritten() const { return m_BytesWritten; }

private:
  std::vector< std::unique_ptr< VTexture > > m_Textures; ///< by image; null until it is found
  std::vector< const VTexture* > m_Found;
  QPointer< QOpenGLContextGroup > m_pGroup;
  std::uint64_t m_Id = 0;
  bool m_bTaken = false;
  QString m_Expression;
  std::uint64_t m_BytesWritten = 0;
};

} // namespace MoxelGraphics
