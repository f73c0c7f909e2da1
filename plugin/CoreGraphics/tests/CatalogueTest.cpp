#include "TestContext.h"

#include <CoreGraphics/ShaderResources.h>

#include <QtCore/QDirIterator>
#include <QtCore/QFile>
#include <QtCore/QFileInfo>
#include <QtCore/QRegularExpression>

#include <map>
#include <set>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;

namespace
{
// Vertex shaders and the fragment shaders that each is drawn with.
const char* const Pairs = R"(FloorGrid: FloorGrid UniformColour; ScreenSpaceAxis: Colour; Sphere: SimpleLighting;
SpherePoint: SimpleLighting; SphereShadow: Colour; Simple3D: UniformColour; Simple3DUniformColour: Colour;
Simple3DVertexColour: Colour; FullScreen: Copy Distort; Simple: Outlines AntiAlias;
ForcePlate: ForcePlate SimpleLighting; Simple3DModel: SimpleLighting;
Simple3DModelColour: SimpleLighting ClipFloor CameraCoverageFurstum;
Simple3DModelWireframe: Colour UniformColour; Locator: Colour; Billboard: ActiveLabelHalo;
PlumeMarkerTrails: Colour; Point3D: Colour; Simple3DPointSize: UniformColour; SimpleColour: Colour;
ColoredLine: StippledLine; Camera: Camera; CameraRay: Colour CameraCoverageFurstum ClipFloor StippledLine;
Edge3D: Colour; Edge2D: Colour; General2D: Colour; MaskSquare: Mask MaskSelection;
Greyscale2D: Greyscale2D Greyscale2DSelection; GreyscaleMaximised: Greyscale2D Greyscale2DSelection;
Greyscale3D: Colour; WandWave2D: WandWave2D; Centroid2D: Centroid2D Centroid2DSelection Colour;
Centroid3D: Colour; Frame: UniformColour; Video: VideoBayer VideoLuminance VideoYUV VideoYUVPlanar;
Stick: Colour SimpleLighting; StickShadow: Colour; Target: SimpleLighting Colour; Segment: Segment;
NonUniformSphere: Covariance; MissingMarker: MissingMarker; FBXSkin: FBXMaterial XRay;
FBXMesh: FBXMaterial XRay; FBXColoredMesh: FBXMaterial SimpleLighting XRay;)";

// The uniforms that the code sets, by type.
const char* const Uniforms = R"(mat4: u_ViewProjection u_View u_Projection mv u_BoneTransforms;
vec4: u_View2D u_Extents u_Colour u_PrimaryColour u_SensorImageOffsetScale u_MapOffsetScale
u_VideoScaleAndOffset u_UserColourA u_UserColourB;
vec2: u_ViewportSize u_ViewportOffset u_FrameSize u_GridSpacings u_SensorSize u_RadialDistortionCentre
u_RotationCentre u_Offset;
vec3: u_LightVector u_Up u_CameraPosition u_SelectionId u_PreSelectColour u_Force u_CentreOfPressure
u_SourcePoint u_RadialDistortionParameters u_SpecularColour u_EmissiveColour;
float: u_GlobalTime u_PointSize u_FrameNumber u_GammaCorrection u_VideoSaturation u_Shininess u_Alpha;
sampler2D: t_Texture t_DiffuseTexture t_Selection t_Buffer t_MapX t_MapY t_TextureY t_TextureU t_TextureV;
mat2: u_Rotation u_RotationInverse;
bool: u_ShowSelection u_Inverted u_ChromaFirst u_HighlightMissing;
int: u_PhaseX u_PhaseY;)";

struct VSource
{
  EShaderType Type;
  QString Path;
  QString Name;
  QString Text;
};

std::vector< VSource > Catalogue()
{
  InitBasicShaderResources();
  InitSceneShaderResources();
  std::vector< VSource > Sources;
  for ( const EShaderType Type : { EVertexShader, EFragmentShader } )
  {
    QDirIterator It( Type == EVertexShader ? ":/VertexShaders" : ":/FragmentShaders" );
    while ( It.hasNext() )
    {
      QFile File( It.next() );
      EXPECT_TRUE( File.open( QIODevice::ReadOnly ) );
      const QFileInfo Info( File.fileName() );
      EXPECT_EQ( Info.suffix(), "glsl" );
      Sources.push_back( { Type, File.fileName(), Info.completeBaseName(), File.readAll() } );
    }
  }
  return Sources;
}

std::string Name( const VSource& i_rSource )
{
  return i_rSource.Path.toStdString();
}

void ExpectAllLink( EShaderDialect i_Dialect )
{
  VResources Resources;
  ASSERT_TRUE( Resources.Prepare() );
  EXPECT_EQ( Resources.Dialect(), i_Dialect );
  for ( const QString& rLook : QString( Pairs ).simplified().split( ';', Qt::SkipEmptyParts ) )
  {
    const std::string Vertex = rLook.section( ':', 0, 0 ).trimmed().toStdString();
    for ( const QString& rFragment : rLook.section( ':', 1 ).split( ' ', Qt::SkipEmptyParts ) )
    {
      const std::string Fragment = rFragment.toStdString();
      EXPECT_TRUE( Resources.GetProgram( Vertex, Fragment )->IsUsable() ) << Vertex << ' ' << Fragment;
      EXPECT_TRUE( Resources.GetProgram( Vertex, Fragment, EFormInstanced )->IsUsable() ) << Vertex << ' ' << Fragment;
    }
  }
  // Whatever can be drawn can be picked.
  for ( const VSource& rSource : Catalogue() )
  {
    if ( rSource.Type == EVertexShader )
    {
      const std::string Vertex = rSource.Name.toStdString();
      EXPECT_TRUE( Resources.GetProgram( Vertex, "Selection" )->IsUsable() ) << Vertex;
      EXPECT_TRUE( Resources.GetProgram( Vertex, "Selection", EFormInstancedSelection )->IsUsable() ) << Vertex;
      EXPECT_TRUE( Resources.GetProgram( Vertex, "Selection", EFormPointsSelection )->IsUsable() ) << Vertex;
    }
  }
}
} // namespace

class CatalogueTest : public testing::TestWithParam< EContextKind >
{
};
INSTANTIATE_TEST_SUITE_P( Contexts, CatalogueTest, testing::Values( EKindCore, EKindCompatibility, EKindES ),
                          KindName );

TEST_P( CatalogueTest, EverySourceCompilesInEveryFormAndDialect )
{
  VTestContext Context( GetParam() );
  for ( const VSource& rSource : Catalogue() )
  {
    for ( const EShaderForm Form : { EFormSingle, EFormInstanced, EFormInstancedSelection, EFormPointsSelection } )
    {
      EXPECT_TRUE( VShader( rSource.Path, rSource.Type, Form, EDialectES300 ).IsCompiled() ) << Name( rSource );
      if ( GetParam() != EKindES )
      {
        EXPECT_TRUE( VShader( rSource.Path, rSource.Type, Form, EDialectDesktop330 ).IsCompiled() ) << Name( rSource );
      }
    }
  }
}

TEST_P( CatalogueTest, EveryPairLinks )
{
  VTestContext Context( GetParam() );
  ExpectAllLink( EDialectES300 );
}

// As in the tests of old contexts.
TEST( OldContextCatalogue, EveryPairLinks )
{
  if ( qEnvironmentVariable( "HARROW_TEST_OLD_CONTEXT" ) != "1" )
  {
    GTEST_SKIP() << "run by CoreGraphicsOldContextTests";
  }
  VTestContext Context( EKindCompatibility );
  ExpectAllLink( EDialectDesktop330 );
}

TEST( CatalogueText, PrecisionIsNeverLowered )
{
  const QRegularExpression Low( "\\b(lowp|mediump)\\b" );
  const QRegularExpression Sampler( "uniform\\s+(?!sampler2D\\b)([iu]?sampler\\w+)" );
  for ( const VSource& rSource : Catalogue() )
  {
    EXPECT_FALSE( rSource.Text.contains( Low ) ) << Name( rSource );
    EXPECT_FALSE( rSource.Text.contains( Sampler ) ) << Name( rSource ) << ": a sampler without highp";
    EXPECT_FALSE( rSource.Text.contains( "#version" ) ) << Name( rSource );
  }
}

// A uniform with a misspelt name or another type compiles and links, and stays 0.
TEST( CatalogueText, EveryUniformIsOneThatSomebodySets )
{
  std::map< QString, QString > Known;
  for ( const QString& rType : QString( Uniforms ).simplified().split( ';', Qt::SkipEmptyParts ) )
  {
    for ( const QString& rName : rType.section( ':', 1 ).split( ' ', Qt::SkipEmptyParts ) )
    {
      Known[rName] = rType.section( ':', 0, 0 ).trimmed();
    }
  }
  std::set< QString > PerObject;
  for ( int Attribute = EAttributeModelTransform; Attribute < EAttributeInstanceFlags; ++Attribute )
  {
    const QString Uniform = AttributeName( EVertexAttribute( Attribute ) );
    Known[Uniform] = Attribute == EAttributeModelTransform ? "mat4" : "vec4";
    PerObject.insert( Uniform );
  }
  const QRegularExpression Declaration( "^(uniform|PER_OBJECT)\\s+(?:highp\\s+)?(\\w+)\\s+(\\w+)\\s*[;\\[]",
                                        QRegularExpression::MultilineOption );
  int Found = 0;
  for ( const VSource& rSource : Catalogue() )
  {
    for ( auto It = Declaration.globalMatch( rSource.Text ); It.hasNext(); ++Found )
    {
      const QRegularExpressionMatch Match = It.next();
      const QString Uniform = Match.captured( 3 );
      ASSERT_TRUE( Known.count( Uniform ) ) << Name( rSource ) << ' ' << Uniform.toStdString();
      EXPECT_EQ( Match.captured( 2 ), Known[Uniform] ) << Name( rSource ) << ' ' << Uniform.toStdString();
      if ( rSource.Type == EVertexShader )
      {
        EXPECT_EQ( Match.captured( 1 ) == "PER_OBJECT", PerObject.count( Uniform ) == 1 )
            << Name( rSource ) << ' ' << Uniform.toStdString();
      }
    }
  }
  EXPECT_GT( Found, 200 );
}
