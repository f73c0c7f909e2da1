#include <MoxelGraphics/VSceneOptions.h>

#include "Log.h"

#include <QtQml/QQmlPropertyMap>

#include <cmath>
#include <optional>
#include <unordered_map>

namespace MoxelGraphics
{
namespace
{
struct VDisplayRow
{
  const char* pName;
  bool VDisplayRecord::*pField;
};

constexpr VDisplayRow DisplayRows[] = {
    { "Enabled", &VDisplayRecord::Enabled },
    { "Axes", &VDisplayRecord::Axes },
    { "Bones", &VDisplayRecord::Bones },
    { "Markers", &VDisplayRecord::Markers },
    { "Sticks", &VDisplayRecord::Sticks },
    { "Joints", &VDisplayRecord::Joints },
    { "MissingMarkers", &VDisplayRecord::MissingMarkers },
    { "Origins", &VDisplayRecord::Origins },
    { "SticksDuringGaps", &VDisplayRecord::SticksDuringGaps },
    { "Targets", &VDisplayRecord::Targets },
    { "TargetCovariances", &VDisplayRecord::TargetCovariances },
    { "Clusters", &VDisplayRecord::Clusters },
    { "Skin", &VDisplayRecord::Skin },
    { "SkinXRay", &VDisplayRecord::SkinXRay },
};

void AddRecord( std::vector< VOptionField >& io_rFields, const char* i_pName, VDisplayRecord VSceneOptions::*i_pRecord )
{
  for ( const VDisplayRow& rRow : DisplayRows )
  {
    io_rFields.push_back( { QStringLiteral( "%1-%2" ).arg( QLatin1String( i_pName ), QLatin1String( rRow.pName ) ),
                            VDisplayField{ i_pRecord, rRow.pField } } );
  }
}

std::vector< VOptionField > MakeFields()
{
  using O = VSceneOptions;
  std::vector< VOptionField > Fields = {
      { "CameraView", &O::CameraView },
      { "3D", &O::Show3DOverlay },
      { "Distort3D", &O::Distort3D },
      { "YUp", &O::YUp },
      { "3DOpacity", &O::Opacity3DOverlay },
      { "OverlayCamera", &O::OverlayCamera },
      { "GlobalAxis", &O::GlobalAxis },
      { "FloorGrid", &O::FloorGrid },
      { "FloorGridIsTranslucent", &O::FloorGridIsTranslucent },
      { "ReconstructionVolume", &O::ReconstructionVolume },
      { "FloorGridSize", &O::FloorGridSize },
      { "Cameras", &O::Cameras },
      { "CameraAxes", &O::CameraAxes },
      { "CameraCylinder", &O::CameraCylinder },
      { "CameraFrustums", &O::CameraFrustums },
      { "CameraRays", &O::CameraRays },
      { "CameraMaskGrid", &O::CameraMaskGrid },
      { "CameraShowRotated", &O::CameraShowRotated },
      { "CameraSnap90Degrees", &O::CameraSnap90Degrees },
      { "CameraGreyscale", &O::CameraGreyscale },
      { "CameraMaximiseGreyscale", &O::CameraMaximiseGreyscale },
      { "CameraMaximiseGreyscaleFactor", &O::CameraMaximiseGreyscaleFactor },
      { "CameraMaximiseGreyscaleHistory", &O::CameraMaximiseGreyscaleHistory, 0 },
      { "CameraCentroids", &O::CameraCentroids },
      { "CameraWandSmear", &O::CameraWandSmear },
      { "CameraBorder", &O::CameraBorder },
      { "Reconstructions", &O::Reconstructions },
      { "ReconstructedRadius", &O::ReconstructedRadius },
      { "ReconstructionScale", &O::ReconstructionScale },
      { "ReconstructionResiduals", &O::ReconstructionResiduals },
      { "ContributionsType", &O::ContributionsType, ENone, EIntersection },
      { "MarkerRadius", &O::MarkerRadius },
      { "FillMethod", &O::FillMethod },
      { "MarkerTrails", &O::MarkerTrails },
      { "AllowTrailKeySelection", &O::AllowTrailKeySelection },
      { "trialLengthPast", &O::trialLengthPast, 0 },
      { "trialLengthFuture", &O::trialLengthFuture, 0 },
      { "TrailUnit", &O::TrailUnit, ETrailFrames, ETrailSeconds },
      { "Locators", &O::Locators },
      { "RigidBodies", &O::RigidBodies },
      { "FBXScene", &O::FBXScene },
      { "Threshold", &O::Threshold },
      { "ActiveLabelHalo", &O::ActiveLabelHalo },
      { "SubjectNames", &O::SubjectNames },
      { "MarkerNames", &O::MarkerNames },
      { "LabelSize", &O::LabelSize, 6, 64 },
      { "LabelDistance", &O::LabelDistance },
      { "LabelLimit", &O::LabelLimit, 0 },
      { "Manipulator", &O::Manipulator },
      { "SubjectPreset", &O::SubjectPreset },
  };
  AddRecord( Fields, "PropSubject", &O::PropSubject );
  AddRecord( Fields, "LabellingSubject", &O::LabellingSubject );
  AddRecord( Fields, "SolvingSubject", &O::SolvingSubject );
  AddRecord( Fields, "RetargetingSubject", &O::RetargetingSubject );
  AddRecord( Fields, "SceneMesh", &O::SceneMesh );
  const VOptionField Rest[] = {
      { "BackgroundColorRGB", &O::BackgroundColorRGB, 0, 0xFFFFFF },
      { "RenderInClipColor", &O::RenderInClipColor },
      { "HighlightCurrentSubject", &O::HighlightCurrentSubject },
      { "CentroidColourScheme", &O::CentroidColourScheme, EColourByConnection, EColourByMarker },
      { "DebugVideo", &O::DebugVideo, 0 },
      { "Video", &O::Video },
      { "SelectedReconCount", &O::SelectedReconCount },
      { "ManipulatorScale", &O::ManipulatorScale },
      { "ImageSetOpacity", &O::ImageSetOpacity },
      { "ImageSetSearchExpression", &O::ImageSetSearchExpression },
  };
  Fields.insert( Fields.end(), std::begin( Rest ), std::end( Rest ) );
  return Fields;
}

bool IsText( const QVariant& i_rValue )
{
  return i_rValue.typeId() == QMetaType::QString;
}

std::optional< bool > ToBool( const QVariant& i_rValue )
{
  if ( IsText( i_rValue ) )
  {
    const QString Text = i_rValue.toString().trimmed().toLower();
    if ( Text == "true" || Text == "1" )
    {
      return true;
    }
    return Text == "false" || Text == "0" ? std::optional( false ) : std::nullopt;
  }
  if ( !i_rValue.isValid() || !i_rValue.canConvert< double >() )
  {
    return std::nullopt;
  }
  const double Number = i_rValue.toDouble();
  return std::isfinite( Number ) ? std::optional( Number != 0.0 ) : std::nullopt;
}

std::optional< double > ToNumber( const QVariant& i_rValue )
{
  // A truth value is no number here: a check box bound to the wrong key should be noticed.
  if ( !i_rValue.isValid() || i_rValue.typeId() == QMetaType::Bool || !i_rValue.canConvert< double >() )
  {
    return std::nullopt;
  }
  bool bOk = false;
  const double Number = i_rValue.toDouble( &bOk );
  return bOk && std::isfinite( Number ) ? std::optional( Number ) : std::nullopt;
}

std::optional< int > ToWhole( const QVariant& i_rValue, const VOptionField& i_rField )
{
  const auto Number = ToNumber( i_rValue );
  if ( !Number || std::round( *Number ) < i_rField.Minimum || std::round( *Number ) > i_rField.Maximum )
  {
    return std::nullopt;
  }
  return static_cast< int >( std::lround( *Number ) );
}

std::optional< QString > ToText( const QVariant& i_rValue )
{
  return IsText( i_rValue ) || ToNumber( i_rValue ) ? std::optional( i_rValue.toString() ) : std::nullopt;
}

template < typename TField, typename TValue >
bool Take( TField& o_rField, const std::optional< TValue >& i_rValue )
{
  if ( i_rValue )
  {
    o_rField = static_cast< TField >( *i_rValue );
  }
  return i_rValue.has_value();
}
} // namespace

const std::vector< VOptionField >& SceneOptionFields()
{
  static const std::vector< VOptionField > Fields = MakeFields();
  return Fields;
}

const VOptionField* FindSceneOption( const QString& i_rKey )
{
  static const auto ByKey = []
  {
    std::unordered_map< QString, const VOptionField* > Map;
    for ( const VOptionField& rField : SceneOptionFields() )
    {
      Map.emplace( rField.Key, &rField );
    }
    return Map;
  }();
  const auto Found = ByKey.find( i_rKey );
  return Found == ByKey.end() ? nullptr : Found->second;
}

QVariant GetSceneOption( const VSceneOptions& i_rOptions, const VOptionField& i_rField )
{
  return std::visit(
      [&]( const auto& i_rMember )
      {
        if constexpr ( std::is_same_v< std::decay_t< decltype( i_rMember ) >, VDisplayField > )
        {
          return QVariant( i_rOptions.*i_rMember.pRecord.*i_rMember.pField );
        }
        else
        {
          return QVariant( i_rOptions.*i_rMember );
        }
      },
      i_rField.Member );
}

bool SetSceneOption( VSceneOptions& io_rOptions, const VOptionField& i_rField, const QVariant& i_rValue )
{
  const auto& rMember = i_rField.Member;
  if ( const auto* pDisplay = std::get_if< VDisplayField >( &rMember ) )
  {
    return Take( io_rOptions.*pDisplay->pRecord.*pDisplay->pField, ToBool( i_rValue ) );
  }
  if ( const auto* pBool = std::get_if< bool VSceneOptions::* >( &rMember ) )
  {
    return Take( io_rOptions.**pBool, ToBool( i_rValue ) );
  }
  if ( const auto* pWhole = std::get_if< int VSceneOptions::* >( &rMember ) )
  {
    return Take( io_rOptions.**pWhole, ToWhole( i_rValue, i_rField ) );
  }
  if ( const auto* pFloat = std::get_if< float VSceneOptions::* >( &rMember ) )
  {
    const auto Number = ToNumber( i_rValue );
    return std::isfinite( static_cast< float >( Number.value_or( 0.0 ) ) ) && Take( io_rOptions.**pFloat, Number );
  }
  if ( const auto* pDouble = std::get_if< double VSceneOptions::* >( &rMember ) )
  {
    return Take( io_rOptions.**pDouble, ToNumber( i_rValue ) );
  }
  return Take( io_rOptions.*std::get< QString VSceneOptions::* >( rMember ), ToText( i_rValue ) );
}

void WriteSceneOptions( const VSceneOptions& i_rOptions, QQmlPropertyMap& o_rMap )
{
  for ( const VOptionField& rField : SceneOptionFields() )
  {
    o_rMap.insert( rField.Key, GetSceneOption( i_rOptions, rField ) );
  }
}

void ReadSceneOptions( QQmlPropertyMap& io_rMap, VSceneOptions& io_rOptions )
{
  for ( const VOptionField& rField : SceneOptionFields() )
  {
    const QVariant Value = io_rMap.value( rField.Key );
    if ( !SetSceneOption( io_rOptions, rField, Value ) )
    {
      ZEK::Log( LogCategory(), ZEK::ELogWarning, "Scene option \"%1%\" cannot take the value \"%2%\"",
                rField.Key.toStdString(), Value.isValid() ? Value.toString().toStdString() : "undefined" );
      io_rMap.insert( rField.Key, GetSceneOption( io_rOptions, rField ) );
    }
  }
}

} // namespace MoxelGraphics
