#include "TestContext.h"

#include <CoreGraphics/ShaderResources.h>

#include <atomic>
#include <cstdlib>
#include <fstream>
#include <map>
#include <new>

static std::atomic< std::uint64_t > s_Allocations{ 0 };

// The sanitizers bring their own; the count then stays 0.
#if !defined( __SANITIZE_ADDRESS__ ) && !defined( __SANITIZE_THREAD__ )
void* operator new( std::size_t i_Size )
{
  s_Allocations.fetch_add( 1, std::memory_order_relaxed );
  void* pMemory = std::malloc( i_Size ? i_Size : 1 );
  if ( !pMemory )
  {
    throw std::bad_alloc();
  }
  return pMemory;
}

void operator delete( void* i_pMemory ) noexcept
{
  std::free( i_pMemory );
}

void operator delete( void* i_pMemory, std::size_t ) noexcept
{
  std::free( i_pMemory );
}
#endif

namespace CoreGraphicsTests
{
namespace
{
// A driver's cache may call a broken source good because it has seen it before.
const bool s_bCacheOff = qputenv( "MESA_SHADER_CACHE_DISABLE", "true" );

auto* const s_pScenes = TUntilTheEnd< std::map< EContextKind, VTestScene > >::Make();

QSurfaceFormat FormatOf( EContextKind i_Kind, bool i_bDebug )
{
  QSurfaceFormat Format; // with nothing asked for, a desktop driver gives its compatibility profile
  if ( i_Kind == EKindCore )
  {
    Format.setVersion( 4, 3 );
    Format.setProfile( QSurfaceFormat::CoreProfile );
  }
  else if ( i_Kind == EKindES )
  {
    Format.setRenderableType( QSurfaceFormat::OpenGLES );
    Format.setVersion( 3, 0 );
  }
  Format.setOption( QSurfaceFormat::DebugContext, i_bDebug );
  return Format;
}
} // namespace

CoreGraphics::VMesh MakeQuad()
{
  return { CoreGraphics::PositionLayout(),
           std::vector< QVector3D >{ { 0, 0, 0 }, { 1, 0, 0 }, { 1, 1, 0 }, { 0, 1, 0 } },
           { 0, 1, 2, 0, 2, 3 } };
}

VTestContext::VTestContext( EContextKind i_Kind, QOpenGLContext* i_pShare, bool i_bDebug )
{
  EXPECT_TRUE( s_bCacheOff );
  CoreGraphics::InitSceneShaderResources();
  Context.setFormat( FormatOf( i_Kind, i_bDebug ) );
  Context.setShareContext( i_pShare );
  EXPECT_TRUE( Context.create() );
  Surface.setFormat( Context.format() );
  Surface.create();
  EXPECT_TRUE( MakeCurrent() );
  EXPECT_EQ( Context.isOpenGLES(), i_Kind == EKindES );
  EXPECT_EQ( Context.format().profile() == QSurfaceFormat::CoreProfile, i_Kind == EKindCore );
  pRender = std::make_unique< CoreGraphics::VRenderContext >();
  pRender->Initialise();
  pTarget = std::make_unique< QOpenGLFramebufferObject >( Side, Side, QOpenGLFramebufferObject::Depth );
}

VTestContext::~VTestContext()
{
  MakeCurrent();
  pRender->CheckErrors();
  pRender.reset();
  pTarget.reset();
  Context.doneCurrent();
}

void VTestContext::Begin( int i_Mode )
{
  pRender->SetRenderMode( i_Mode );
  pRender->ResetState();
  pRender->BindFramebuffer( pTarget.get() );
  pRender->SetViewport( QRect( 0, 0, Side, Side ) );
  pRender->SetScissor( QRect( 0, 0, Side, Side ) );
  pRender->SetFrameSize( QSize( Side, Side ) );
  pRender->SetClearColour( QColor( 0, 0, 0, 0 ) );
  pRender->Clear( true, true );
}

bool VTestContext::Fill( CoreGraphics::VMesh& i_rQuad,
                         const std::shared_ptr< CoreGraphics::VShaderProgram >& i_rpProgram,
                         const QVector4D& i_rColour )
{
  if ( !pRender->UseProgram( i_rpProgram ) || !pRender->SetVertexBuffer( i_rQuad.Stream() ) )
  {
    return false;
  }
  i_rpProgram->SetUniform( i_rpProgram->UniformLocation( "u_Colour" ), i_rColour );
  pRender->DrawElements( GL_TRIANGLES, i_rQuad );
  return true;
}

std::vector< std::uint32_t > VTestContext::Pixels()
{
  std::vector< std::uint32_t > Words( Side * Side );
  pRender->ReadPixels( QRect( 0, 0, Side, Side ), Words.data(), GL_RGBA );
  pRender->CheckErrors();
  return Words;
}

int VTestContext::Covered()
{
  int Count = 0;
  for ( const std::uint32_t Word : Pixels() )
  {
    Count += ( Word & 0xFFFFFF ) != 0;
  }
  return Count;
}

VTestScene::VTestScene( EContextKind i_Kind )
  : VTestContext( i_Kind )
{
  EXPECT_TRUE( Resources.Prepare() );
}

VTestScene& SharedScene( EContextKind i_Kind )
{
  VTestScene& rScene = s_pScenes->Object().try_emplace( i_Kind, i_Kind ).first->second;
  EXPECT_TRUE( rScene.MakeCurrent() );
  return rScene;
}

void WriteText( const std::filesystem::path& i_rPath, const std::string& i_rText )
{
  std::filesystem::create_directories( i_rPath.parent_path() );
  std::ofstream( i_rPath, std::ios::binary ) << i_rText;
}

std::string KindName( const testing::TestParamInfo< EContextKind >& i_rInfo )
{
  static const std::array< std::string, 3 > Names = { "Core", "Compatibility", "ES" };
  return Names[i_rInfo.param];
}

bool IsOldContext()
{
  return qEnvironmentVariable( "HARROW_TEST_OLD_CONTEXT" ) == "1";
}

std::uint64_t AllocationCount()
{
  return s_Allocations.load( std::memory_order_relaxed );
}

} // namespace CoreGraphicsTests
