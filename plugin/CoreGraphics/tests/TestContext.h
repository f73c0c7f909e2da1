#pragma once

#include <CoreGraphics/VProgramPair.h>
#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

#include <HarrowPluginInterface/IHarrowServices.h>

#include <QtGui/QOffscreenSurface>
#include <QtGui/QOpenGLContext>
#include <QtOpenGL/QOpenGLFramebufferObject>

#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <memory>
#include <string>
#include <vector>

namespace CoreGraphicsTests
{

enum EContextKind
{
  EKindCore,
  EKindCompatibility,
  EKindES
};

/// An OpenGL context of its own share group (unless it is given one to share with), current from the start, with a
/// target of 64 by 64 pixels and a render context that begins its frame.
class VTestContext
{
public:
  static constexpr int Side = 64;

  explicit VTestContext( EContextKind i_Kind, QOpenGLContext* i_pShare = nullptr, bool i_bDebug = false );
  ~VTestContext();

  bool MakeCurrent() { return Context.makeCurrent( &Surface ); }
  /// Binds and clears the target, sets the viewport to all of it.
  void Begin( int i_Mode = 0 );
  /// The target's pixels from the bottom row up, as the words R | G << 8 | B << 16 | A << 24.
  std::vector< std::uint32_t > Pixels();
  /// How many pixels are not black.
  int Covered();

  QOffscreenSurface Surface;
  QOpenGLContext Context;
  std::unique_ptr< CoreGraphics::VRenderContext > pRender;
  std::unique_ptr< QOpenGLFramebufferObject > pTarget;
};

/// Shader folders as a host gives them.
class VFakeRenderResources : public HarrowPluginInterface::IRenderResources
{
public:
  std::vector< std::filesystem::path > OverrideFolders() const override { return Folders; }
  std::uint64_t Generation() const override { return Number; }
  void Reload() override { ++Number; }
  ZEK::IMultiCallback< void() >& ReloadRequested() override { return Requested; }

  std::vector< std::filesystem::path > Folders;
  std::uint64_t Number = 0;
  ZEK::VMultiCallback< void() > Requested;
};

void WriteText( const std::filesystem::path& i_rPath, const std::string& i_rText );
std::string KindName( const testing::TestParamInfo< EContextKind >& i_rInfo );

/// Allocations by operator new in this process so far.
std::uint64_t AllocationCount();

} // namespace CoreGraphicsTests
