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
  VResources Resources;
  ASSERT_TRUE( Resources.Prepare() );
  const std::vector< std::array< const char*, 2 > > Pairs = { { "FloorGrid", "FloorGrid" },
                                                              { "FloorGrid", "UniformColour" },
                                                              { "ScreenSpaceAxis", "Colour" },
                                                              { "Sphere", "SimpleLighting" },
                                                              { "SpherePoint", "SimpleLighting" },
                                                              { "SphereShadow", "Colour" },
                                                              { "Simple3D", "UniformColour" },
                                                              { "Simple3DUniformColour", "Colour" },
                                                              { "Simple3DVertexColour", "Colour" },
                                                              { "FullScreen", "Copy" },
                                                              { "Simple", "Outlines" },
                                                              { "Simple", "AntiAlias" },
                                                              { "ForcePlate", "ForcePlate" },
                                                              { "ForcePlate", "SimpleLighting" },
                                                              { "Simple3DModel", "SimpleLighting" },
                                                              { "Simple3DModelColour", "SimpleLighting" },
                                                              { "Simple3DModelColour", "ClipFloor" },
                                                              { "Simple3DModelWireframe", "Colour" },
                                                              { "Simple3DModelWireframe", "UniformColour" },
                                                              { "Locator", "Colour" },
                                                              { "Billboard", "ActiveLabelHalo" },
                                                              { "PlumeMarkerTrails", "Colour" },
                                                              { "Point3D", "Colour" },
                                                              { "Simple3DPointSize", "UniformColour" },
                                                              { "SimpleColour", "Colour" },
                                                              { "ColoredLine", "StippledLine" },
                                                              { "Camera", "Camera" },
                                                              { "CameraRay", "Colour" },
                                                              { "CameraRay", "CameraCoverageFurstum" },
                                                              { "Simple3DModelColour", "CameraCoverageFurstum" },
                                                              { "CameraRay", "ClipFloor" },
                                                              { "CameraRay", "StippledLine" },
                                                              { "Edge3D", "Colour" },
                                                              { "Edge2D", "Colour" },
                                                              { "General2D", "Colour" },
                                                              { "MaskSquare", "Mask" },
                                                              { "MaskSquare", "MaskSelection" },
                                                              { "Greyscale2D", "Greyscale2D" },
                                                              { "Greyscale2D", "Greyscale2DSelection" },
                                                              { "GreyscaleMaximised", "Greyscale2D" },
                                                              { "GreyscaleMaximised", "Greyscale2DSelection" },
                                                              { "Greyscale3D", "Colour" },
                                                              { "WandWave2D", "WandWave2D" },
                                                              { "Centroid2D", "Centroid2D" },
                                                              { "Centroid2D", "Centroid2DSelection" },
                                                              { "Centroid2D", "Colour" },
                                                              { "Centroid3D", "Colour" },
                                                              { "Frame", "UniformColour" },
                                                              { "FullScreen", "Distort" },
                                                              { "Video", "VideoBayer" },
                                                              { "Video", "VideoLuminance" },
                                                              { "Video", "VideoYUV" },
                                                              { "Video", "VideoYUVPlanar" },
                                                              { "Stick", "Colour" },
                                                              { "Stick", "SimpleLighting" },
                                                              { "StickShadow", "Colour" },
                                                              { "Target", "SimpleLighting" },
                                                              { "Target", "Colour" },
                                                              { "Segment", "Segment" },
                                                              { "NonUniformSphere", "Covariance" },
                                                              { "MissingMarker", "MissingMarker" },
                                                              { "FBXSkin", "FBXMaterial" },
                                                              { "FBXSkin", "XRay" },
                                                              { "FBXMesh", "FBXMaterial" },
                                                              { "FBXMesh", "XRay" },
                                                              { "FBXColoredMesh", "FBXMaterial" },
                                                              { "FBXColoredMesh", "SimpleLighting" },
                                                              { "FBXColoredMesh", "XRay" } };
  for ( const auto& [pVertex, pFragment] : Pairs )
  {
    EXPECT_TRUE( Resources.GetProgram( pVertex, pFragment )->IsUsable() ) << pVertex << ' ' << pFragment;
    EXPECT_TRUE( Resources.GetProgram( pVertex, pFragment, EFormInstanced )->IsUsable() ) << pVertex;
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
  std::map< QString, QString > Known = { { "u_ViewProjection", "mat4" },
                                         { "u_View", "mat4" },
                                         { "u_Projection", "mat4" },
                                         { "u_View2D", "vec4" },
                                         { "u_ViewportSize", "vec2" },
                                         { "u_ViewportOffset", "vec2" },
                                         { "u_FrameSize", "vec2" },
                                         { "u_LightVector", "vec3" },
                                         { "u_Up", "vec3" },
                                         { "u_GlobalTime", "float" },
                                         { "u_CameraPosition", "vec3" },
                                         { "u_Extents", "vec4" },
                                         { "u_GridSpacings", "vec2" },
                                         { "t_Texture", "sampler2D" },
                                         { "t_DiffuseTexture", "sampler2D" },
                                         { "u_Colour", "vec4" },
                                         { "u_SelectionId", "vec3" },
                                         { "t_Selection", "sampler2D" },
                                         { "t_Buffer", "sampler2D" },
                                         { "u_PrimaryColour", "vec4" },
                                         { "u_PreSelectColour", "vec3" },
                                         { "u_Force", "vec3" },
                                         { "u_CentreOfPressure", "vec3" },
                                         { "u_PointSize", "float" },
                                         { "mv", "mat4" },
                                         { "u_SourcePoint", "vec3" },
                                         { "u_SensorSize", "vec2" },
                                         { "u_SensorImageOffsetScale", "vec4" },
                                         { "u_MapOffsetScale", "vec4" },
                                         { "t_MapX", "sampler2D" },
                                         { "t_MapY", "sampler2D" },
                                         { "u_RadialDistortionCentre", "vec2" },
                                         { "u_RadialDistortionParameters", "vec3" },
                                         { "u_RotationCentre", "vec2" },
                                         { "u_Rotation", "mat2" },
                                         { "u_RotationInverse", "mat2" },
                                         { "u_Offset", "vec2" },
                                         { "u_ShowSelection", "bool" },
                                         { "u_FrameNumber", "float" },
                                         { "u_VideoScaleAndOffset", "vec4" },
                                         { "u_Inverted", "bool" },
                                         { "u_GammaCorrection", "float" },
                                         { "u_VideoSaturation", "float" },
                                         { "u_PhaseX", "int" },
                                         { "u_PhaseY", "int" },
                                         { "u_ChromaFirst", "bool" },
                                         { "t_TextureY", "sampler2D" },
                                         { "t_TextureU", "sampler2D" },
                                         { "t_TextureV", "sampler2D" },
                                         { "u_BoneTransforms", "mat4" },
                                         { "u_HighlightMissing", "bool" },
                                         { "u_UserColourA", "vec4" },
                                         { "u_UserColourB", "vec4" },
                                         { "u_SpecularColour", "vec3" },
                                         { "u_EmissiveColour", "vec3" },
                                         { "u_Shininess", "float" },
                                         { "u_Alpha", "float" } };
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
