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
  /// Draws a quad with a program of "FullScreen" that may have "u_Colour". False: refused.
  bool Fill( CoreGraphics::VMesh& i_rQuad, const std::shared_ptr< CoreGraphics::VShaderProgram >& i_rpProgram,
             const QVector4D& i_rColour );
  /// The target's pixels from the bottom row up, as the words R | G << 8 | B << 16 | A << 24.
  std::vector< std::uint32_t > Pixels();
  /// How many pixels are not black.
  int Covered();

  QOffscreenSurface Surface;
  QOpenGLContext Context;
  std::unique_ptr< CoreGraphics::VRenderContext > pRender;
  std::unique_ptr< QOpenGLFramebufferObject > pTarget;
};

/// A square over all of the target, for the vertex program "FullScreen".
CoreGraphics::VMesh MakeQuad();

/// A context with what most draws need.
class VTestScene : public VTestContext
{
public:
  explicit VTestScene( EContextKind i_Kind );
  ~VTestScene() { MakeCurrent(); }

  CoreGraphics::VResources Resources;
  CoreGraphics::VMesh Quad = MakeQuad();
};

/// The only scene of its kind in the process, made at the first call. Current.
VTestScene& SharedScene( EContextKind i_Kind );

/// Keeps an object until all tests have run, but no longer than the application.
template < typename T >
class TUntilTheEnd : public testing::Environment
{
public:
  static TUntilTheEnd* Make()
  {
    auto* pMade = new TUntilTheEnd;
    testing::AddGlobalTestEnvironment( pMade );
    return pMade;
  }
  T& Object() { return m_pObject ? *m_pObject : *( m_pObject = std::make_unique< T >() ); }
  void TearDown() override { m_pObject.reset(); }

private:
  std::unique_ptr< T > m_pObject;
};

/// Tests that draw in the scene of each kind.
class DrawingTest : public testing::TestWithParam< EContextKind >
{
public:
  ~DrawingTest() override { EXPECT_EQ( pGl->glGetError(), GLenum( GL_NO_ERROR ) ); }

  VTestScene& Context = SharedScene( GetParam() );
  CoreGraphics::VRenderContext& rRender = *Context.pRender;
  QOpenGLExtraFunctions* pGl = rRender.Functions();
  CoreGraphics::VResources& rResources = Context.Resources;
};
std::string KindName( const testing::TestParamInfo< EContextKind >& i_rInfo );
inline const auto AllKinds = testing::Values( EKindCore, EKindCompatibility, EKindES );

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

/// Whether the driver was told to offer OpenGL 3.3 without the ES 3 language.
bool IsOldContext();
/// Allocations by operator new in this process so far.
std::uint64_t AllocationCount();

} // namespace CoreGraphicsTests
