#include "Report.h"

#include <HarrowPluginInterface/IWorkspaceContent.h>

#include <QtGui/QImage>

namespace HostWindow
{
namespace
{
const char* KindName( std::uint32_t i_Kind )
{
  switch ( i_Kind )
  {
  case ZEK::ESelectCentroid:
    return "centroid";
  case ZEK::ESelectMaskCell:
    return "mask cell";
  case ZEK::ESelectReconstruction:
    return "reconstruction";
  case ZEK::ESelectMarker:
    return "marker";
  case ZEK::ESelectSegment:
    return "segment";
  case ZEK::ESelectSubject:
    return "subject";
  case ZEK::ESelectStick:
    return "stick";
  case ZEK::ESelectRigidObject:
    return "rigid object";
  case ZEK::ESelectDevice:
    return "device";
  case ZEK::ESelectSceneMesh:
    return "scene mesh";
  case ZEK::ESelectObjectManipulator:
    return "object manipulator";
  case ZEK::ESelectGreyscaleBlob:
    return "greyscale blob";
  case ZEK::ESelectVolumeManipulator:
    return "volume manipulator";
  default:
    return "unknown";
  }
}

/// JSON of what a view reports. Whole numbers stay numbers, whatever their type.
QJsonValue ToJson( const QVariant& i_rValue )
{
  switch ( i_rValue.typeId() )
  {
  case QMetaType::QVariantMap:
  {
    QJsonObject Object;
    const QVariantMap Map = i_rValue.toMap();
    for ( auto it = Map.begin(); it != Map.end(); ++it )
    {
      Object[it.key()] = ToJson( it.value() );
    }
    return Object;
  }
  case QMetaType::QVariantList:
  {
    QJsonArray Array;
    for ( const QVariant& rValue : i_rValue.toList() )
    {
      Array.append( ToJson( rValue ) );
    }
    return Array;
  }
  case QMetaType::Long:
  case QMetaType::ULong:
  case QMetaType::LongLong:
  case QMetaType::ULongLong:
    return i_rValue.toLongLong();
  default:
    return QJsonValue::fromVariant( i_rValue );
  }
}

QJsonArray LogOf( const ZEK::VLogRing& i_rRing )
{
  QJsonArray Lines;
  for ( const ZEK::VLogLine& rLine : i_rRing.Lines() )
  {
    if ( rLine.Level == ZEK::ELogFailure || rLine.Level == ZEK::ELogWarning )
    {
      Lines.append( QJsonObject{ { "level", rLine.Level },
                                 { "category", QString::fromStdString( rLine.Category ) },
                                 { "text", QString::fromStdString( rLine.Text ) } } );
    }
  }
  return Lines;
}

QJsonObject FrameOf( const HostSources::IFrameSource& i_rSource, std::int64_t i_Index )
{
  return { { "index", static_cast< qint64 >( i_Index ) },
           { "number", static_cast< qint64 >( i_rSource.FrameNumber( i_Index ) ) },
           { "time", static_cast< double >( i_Index ) / i_rSource.RateHz() },
           { "count", static_cast< qint64 >( i_rSource.FrameCount() ) },
           { "rate", i_rSource.RateHz() } };
}

QJsonObject UpAxisOf( const HostSources::IFrameSource& i_rSource )
{
  return { { "axis", i_rSource.UpAxis() == HostSources::EUpAxis::Y ? "y" : "z" },
           { "reason", QString::fromStdString( i_rSource.UpAxisReason() ) } };
}

/// What was odd about the recording; empty for the simulated capture.
QJsonArray NotesOf( const HostSources::IFrameSource& i_rSource )
{
  QJsonArray Notes;
  if ( const auto* pRecording = dynamic_cast< const HostSources::VRecordingSource* >( &i_rSource ) )
  {
    for ( const std::string& rNote : pRecording->Recording().Notes )
    {
      Notes.append( QString::fromStdString( rNote ) );
    }
  }
  return Notes;
}

QJsonObject OptionsOf( const std::vector< VViewAction >& i_rActions, const VSceneView& i_rView )
{
  QJsonObject Options;
  for ( const VViewAction& rAction : i_rActions )
  {
    if ( const auto* pSet = std::get_if< VSetAction >( &rAction.What ) )
    {
      Options[pSet->Key] = ToJson( i_rView.Option( pSet->Key ) );
    }
  }
  return Options;
}
} // namespace

QString SelectionLabel( const ZEK::VSelectionItem& i_rItem )
{
  if ( i_rItem.Device.empty() )
  {
    return QString( "%1 %2" ).arg( KindName( i_rItem.Kind ) ).arg( i_rItem.Sub );
  }
  const QString Device = QString::fromStdString( i_rItem.Device );
  const bool bHasNumber = i_rItem.Kind == ZEK::ESelectCentroid || i_rItem.Kind == ZEK::ESelectMaskCell ||
                          i_rItem.Kind == ZEK::ESelectGreyscaleBlob;
  return bHasNumber ? QString( "%1 %2 of %3" ).arg( KindName( i_rItem.Kind ) ).arg( i_rItem.Sub ).arg( Device )
                    : Device;
}

QJsonArray DescribeSelection( const HostServices::VSelectionService& i_rService, ZEK::ISelectionService::ESet i_Set )
{
  QJsonArray Items;
  const ZEK::VSelection Selection = i_rService.Get( i_Set );
  for ( const ZEK::VSelectionItem& rItem : Selection )
  {
    Items.append( QJsonObject{ { "kind", static_cast< int >( rItem.Kind ) },
                               { "kindName", KindName( rItem.Kind ) },
                               { "text", QString::fromStdString( i_rService.Text( rItem ) ) },
                               { "label", SelectionLabel( rItem ) },
                               { "current", &rItem == &Selection.back() } } );
  }
  return Items;
}

QJsonObject DescribeAction( const VViewAction& i_rAction, VSession& i_rSession, const VSceneView& i_rView )
{
  const auto& rSelection = *i_rSession.Host().Selection();
  return { { "action", QString::fromStdString( i_rAction.Option ).mid( 2 ) },
           { "text", QString::fromStdString( i_rAction.Text ) },
           { "selection", DescribeSelection( rSelection, ZEK::ISelectionService::EPrimary ) },
           { "preselection", DescribeSelection( rSelection, ZEK::ISelectionService::ESecondary ) },
           { "toolTip", i_rView.ToolTip() },
           { "labels", ToJson( i_rView.FrameReport().value( "labels" ) ) } };
}

QJsonObject DescribeView( VSession& i_rSession, const VRenderOptions& i_rRender, const std::string& i_rWindow,
                          const VSceneView& i_rView, const QImage& i_rPicture )
{
  QJsonObject Report;
  if ( const HostSources::IFrameSource* pSource = i_rSession.Source() )
  {
    Report["source"] = QString::fromStdString( i_rRender.Sources.front() );
    Report["sourceName"] = QString::fromStdString( pSource->Name() );
    Report["frame"] = FrameOf( *pSource, i_rSession.ShownFrame() );
    Report["upAxis"] = UpAxisOf( *pSource );
    Report["notes"] = NotesOf( *pSource );
  }
  Report["window"] = QString::fromStdString( i_rWindow );
  const QSizeF Size = i_rView.Item() ? i_rView.Item()->size() : QSizeF();
  Report["size"] = QJsonObject{ { "width", Size.width() }, { "height", Size.height() } };
  Report["ratio"] = i_rPicture.devicePixelRatio();
  Report["picture"] = QJsonObject{ { "width", i_rPicture.width() }, { "height", i_rPicture.height() } };
  Report["options"] = OptionsOf( i_rRender.Actions, i_rView );
  const auto& rSelection = *i_rSession.Host().Selection();
  Report["selection"] = DescribeSelection( rSelection, ZEK::ISelectionService::EPrimary );
  Report["preselection"] = DescribeSelection( rSelection, ZEK::ISelectionService::ESecondary );
  const QVariantMap Frame = i_rView.FrameReport();
  for ( const char* pMember :
        { "camera", "timings", "draw_calls", "bytes_uploaded", "gl", "frames", "notice", "contributions", "subjects" } )
  {
    Report[pMember] = ToJson( Frame.value( pMember ) );
  }
  if ( const QVariant Subjects = Frame.value( "subjectScene" ); Subjects.isValid() )
  {
    Report["subjectScene"] = ToJson( Subjects );
  }
  if ( const QVariantList Tiles = i_rView.CameraReport(); !Tiles.isEmpty() )
  {
    Report["tiles"] = ToJson( Tiles );
  }
  Report["log"] = LogOf( *i_rSession.LogRing() );
  return Report;
}

} // namespace HostWindow
