#include <MoxelGraphics/VSceneOptions.h>

#include <TestSupport/LogGuard.h>

#include <QtQml/QQmlPropertyMap>

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

namespace MoxelGraphics
{
namespace
{
QVariant Other( const VSceneOptions& i_rOptions, const VOptionField& i_rField )
{
  const QVariant Value = GetSceneOption( i_rOptions, i_rField );
  switch ( Value.typeId() )
  {
  case QMetaType::Bool:
    return !Value.toBool();
  case QMetaType::Int:
    return Value.toInt() + 1;
  case QMetaType::QString:
    return "other " + i_rField.Key;
  default:
    return QVariant( Value.toDouble() + 0.25 );
  }
}
} // namespace

TEST( SceneOptions, EveryKeyGoesIntoTheMapAndBackToItsOwnField )
{
  ASSERT_EQ( SceneOptionFields().size(), 60u + 5u * 14u );
  for ( const VOptionField& rField : SceneOptionFields() )
  {
    SCOPED_TRACE( rField.Key.toStdString() );
    QQmlPropertyMap Map;
    const VSceneOptions Defaults;
    WriteSceneOptions( Defaults, Map );
    Map.insert( rField.Key, Other( Defaults, rField ) );
    VSceneOptions Read;
    ReadSceneOptions( Map, Read );
    EXPECT_EQ( GetSceneOption( Read, rField ), Other( Defaults, rField ) );
    // This field alone has changed.
    EXPECT_FALSE( Read == Defaults );
    ASSERT_TRUE( SetSceneOption( Read, rField, GetSceneOption( Defaults, rField ) ) );
    EXPECT_TRUE( Read == Defaults );
    EXPECT_EQ( FindSceneOption( rField.Key ), &rField );
  }
  EXPECT_EQ( FindSceneOption( "Show3D" ), nullptr );
}

TEST( SceneOptions, DefaultsAreThoseThatViewsStartWith )
{
  QQmlPropertyMap Map;
  WriteSceneOptions( {}, Map );
  EXPECT_EQ( Map.value( "3D" ), true );
  EXPECT_EQ( Map.value( "CameraView" ), false );
  EXPECT_EQ( Map.value( "3DOpacity" ), 1.0 );
  EXPECT_EQ( Map.value( "FloorGridSize" ).toFloat(), 6.0f );
  EXPECT_EQ( Map.value( "CameraMaximiseGreyscaleHistory" ), 128 );
  EXPECT_EQ( Map.value( "BackgroundColorRGB" ), 0x202020 );
  EXPECT_EQ( Map.value( "trialLengthPast" ), 10 );
  EXPECT_EQ( Map.value( "ContributionsType" ), 0 );
  for ( const char* pRecord :
        { "PropSubject", "LabellingSubject", "SolvingSubject", "RetargetingSubject", "SceneMesh" } )
  {
    QStringList On;
    for ( const VOptionField& rField : SceneOptionFields() )
    {
      if ( rField.Key.startsWith( QLatin1String( pRecord ) + "-" ) && Map.value( rField.Key ).toBool() )
      {
        On.append( rField.Key.section( '-', 1 ) );
      }
    }
    EXPECT_EQ( On.join( ' ' ), "Enabled Bones Markers Sticks MissingMarkers Origins Clusters Skin" ) << pRecord;
  }
}

TEST( SceneOptions, ValuesOfAnotherTypeLeaveTheFieldAndAreTakenBack )
{
  const std::pair< const char*, QVariant > Bad[] = {
      { "FloorGrid", "perhaps" },
      { "FloorGrid", QVariant() },
      { "PropSubject-Axes", QVariantList{ true } },
      { "3DOpacity", std::numeric_limits< double >::quiet_NaN() },
      { "ReconstructionScale", std::numeric_limits< double >::infinity() },
      { "ReconstructionScale", 1e300 },
      { "ReconstructionScale", "wide" },
      { "ContributionsType", 5 },
      { "ContributionsType", -1 },
      { "CentroidColourScheme", 3 },
      { "trialLengthPast", 1e12 },
      { "BackgroundColorRGB", 0x1000000 },
      { "OverlayCamera", QVariantMap{ { "a", 1 } } },
  };
  for ( const auto& [pKey, Value] : Bad )
  {
    SCOPED_TRACE( pKey );
    QQmlPropertyMap Map;
    WriteSceneOptions( {}, Map );
    Map.insert( pKey, Value );
    VSceneOptions Options;
    const std::size_t Lines = TestSupport::LogTexts( "MoxelGraphics", ZEK::ELogWarning ).size();
    ReadSceneOptions( Map, Options );
    EXPECT_TRUE( Options == VSceneOptions() );
    EXPECT_EQ( Map.value( pKey ), GetSceneOption( {}, *FindSceneOption( pKey ) ) );
    EXPECT_EQ( TestSupport::LogTexts( "MoxelGraphics", ZEK::ELogWarning ).size(), Lines + 1 );
  }
}

TEST( SceneOptions, WhatQmlAndCommandLinesWriteIsUnderstood )
{
  VSceneOptions Options;
  const std::tuple< const char*, QVariant, QVariant > Cases[] = { { "FloorGrid", "false", false },
                                                                  { "FloorGrid", 1, true },
                                                                  { "trialLengthPast", 12.0, 12 },
                                                                  { "ReconstructionScale", "2.5", 2.5F } };
  for ( const auto& [pKey, Written, Read] : Cases )
  {
    EXPECT_TRUE( SetSceneOption( Options, *FindSceneOption( pKey ), Written ) );
    EXPECT_EQ( GetSceneOption( Options, *FindSceneOption( pKey ) ), Read ) << pKey;
  }
}

} // namespace MoxelGraphics
