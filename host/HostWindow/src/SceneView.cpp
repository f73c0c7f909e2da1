#include <HostWindow/SceneView.h>

#include <HarrowPluginInterface/IWorkspaceContent.h>

#include <QtQml/QQmlError>
#include <QtQml/QQmlPropertyMap>

#include <algorithm>
#include <numeric>

namespace HostWindow
{
namespace
{
bool IsSceneItem( const QObject& i_rObject )
{
  for ( const QMetaObject* pMeta = i_rObject.metaObject(); pMeta; pMeta = pMeta->superClass() )
  {
    if ( qstrcmp( pMeta->className(), "MoxelGraphics::VSceneFramebufferObject" ) == 0 )
    {
      return true;
    }
  }
  return false;
}

QQuickItem* FindSceneItem( QQuickItem* i_pRoot )
{
  if ( !i_pRoot || IsSceneItem( *i_pRoot ) )
  {
    return i_pRoot;
  }
  for ( QQuickItem* pChild : i_pRoot->childItems() )
  {
    if ( QQuickItem* pFound = FindSceneItem( pChild ) )
    {
      return pFound;
    }
  }
  return nullptr;
}

QQmlPropertyMap* OptionsOf( const QQuickItem* i_pItem )
{
  return i_pItem ? qobject_cast< QQmlPropertyMap* >( i_pItem->property( "sceneOptions" ).value< QObject* >() )
                 : nullptr;
}

int EditDistance( const QString& i_rA, const QString& i_rB )
{
  std::vector< int > Row( static_cast< std::size_t >( i_rB.size() ) + 1 );
  std::iota( Row.begin(), Row.end(), 0 );
  for ( qsizetype a = 0; a < i_rA.size(); ++a )
  {
    int Diagonal = Row[0];
    Row[0] = static_cast< int >( a ) + 1;
    for ( qsizetype b = 0; b < i_rB.size(); ++b )
    {
      const auto At = static_cast< std::size_t >( b ) + 1;
      const int Replaced = Diagonal + ( i_rA[a].toLower() == i_rB[b].toLower() ? 0 : 1 );
      Diagonal = Row[At];
      Row[At] = std::min( { Row[At] + 1, Row[At - 1] + 1, Replaced } );
    }
  }
  return Row.back();
}
} // namespace

QQuickWidget* VSceneView::Widget() const
{
  if ( !m_pWidget && m_pContent )
  {
    m_pWidget = qobject_cast< QQuickWidget* >( m_pContent.data() );
    if ( !m_pWidget )
    {
      m_pWidget = m_pContent->findChild< QQuickWidget* >();
    }
  }
  return m_pWidget;
}

QQuickItem* VSceneView::Item() const
{
  if ( !m_pItem && Widget() )
  {
    m_pItem = FindSceneItem( Widget()->rootObject() );
  }
  return m_pItem;
}

QString VSceneView::LoadErrors() const
{
  if ( !Widget() )
  {
    return "the window holds no Qt Quick view";
  }
  QStringList Texts;
  for ( const QQmlError& rError : Widget()->errors() )
  {
    Texts << rError.toString();
  }
  if ( Texts.isEmpty() && !Item() )
  {
    Texts << "its document holds no scene item";
  }
  return Texts.join( "; " );
}

QStringList VSceneView::OptionKeys() const
{
  const QQmlPropertyMap* pOptions = OptionsOf( Item() );
  return pOptions ? pOptions->keys() : QStringList();
}

QVariant VSceneView::Option( const QString& i_rKey ) const
{
  const QQmlPropertyMap* pOptions = OptionsOf( Item() );
  return pOptions ? pOptions->value( i_rKey ) : QVariant();
}

bool VSceneView::SetOption( const QString& i_rKey, const QVariant& i_rValue )
{
  return OptionKeys().contains( i_rKey ) &&
         QMetaObject::invokeMethod( Item(), "setOption", Q_ARG( QString, i_rKey ), Q_ARG( QVariant, i_rValue ) );
}

void VSceneView::SetViewType( int i_Index )
{
  if ( Widget() )
  {
    QMetaObject::invokeMethod( Widget(), "OnCameraTypeChanged", Q_ARG( int, i_Index ) );
  }
}

int VSceneView::ViewType() const
{
  return Item() ? Item()->property( "cameraType" ).toInt() : -1;
}

int VSceneView::Tracking() const
{
  return Item() ? Item()->property( "tracking" ).toInt() : -1;
}

bool VSceneView::TrackingSupported() const
{
  const QVariant Supported = Widget() ? Widget()->property( "trackingSupported" ) : QVariant();
  return !Supported.isValid() || Supported.toBool();
}

bool VSceneView::SelectionHasBounds() const
{
  bool bHas = false;
  return Widget() && QMetaObject::invokeMethod( Widget(), "selectionHasBounds", Q_RETURN_ARG( bool, bHas ) ) && bHas;
}

bool VSceneView::SelectionHasPose() const
{
  bool bHas = false;
  return Widget() && QMetaObject::invokeMethod( Widget(), "selectionHasPose", Q_RETURN_ARG( bool, bHas ) ) && bHas;
}

void VSceneView::FocusSelected()
{
  if ( Widget() )
  {
    QMetaObject::invokeMethod( Widget(), "OnFocus" );
  }
}

bool VSceneView::ExecuteCommand( const std::string& i_rText )
{
  auto* pCommands = dynamic_cast< HarrowPluginInterface::IHarrowExecuteCommand* >( m_pContent.data() );
  return pCommands && pCommands->ExecuteCommand( i_rText );
}

void VSceneView::SetPoses( int i_All, int i_Labelling, int i_Solving )
{
  if ( Widget() )
  {
    Widget()->setProperty( "poseIndex", i_All );
    Widget()->setProperty( "labellingPoseIndex", i_Labelling );
    Widget()->setProperty( "solvingPoseIndex", i_Solving );
  }
}

void VSceneView::SetReporting( bool i_bOn )
{
  if ( Item() )
  {
    QMetaObject::invokeMethod( Item(), "setReporting", Q_ARG( bool, i_bOn ) );
  }
}

QVariantMap VSceneView::FrameReport() const
{
  QVariantMap Report;
  if ( Item() )
  {
    QMetaObject::invokeMethod( Item(), "frameReport", Q_RETURN_ARG( QVariantMap, Report ) );
  }
  return Report;
}

QVariantList VSceneView::CameraReport() const
{
  QVariantList Tiles;
  if ( Widget() )
  {
    QMetaObject::invokeMethod( Widget(), "cameraReport", Q_RETURN_ARG( QVariantList, Tiles ) );
  }
  return Tiles;
}

qint64 VSceneView::Frames() const
{
  return FrameReport().value( "frames" ).toLongLong();
}

QString VSceneView::ToolTip() const
{
  return Item() ? Item()->property( "toolTipText" ).toString() : QString();
}

QStringList Nearest( const QString& i_rName, const QStringList& i_rNames, int i_Most )
{
  std::vector< std::pair< int, QString > > Ranked;
  for ( const QString& rName : i_rNames )
  {
    Ranked.emplace_back( EditDistance( i_rName, rName ), rName );
  }
  std::sort( Ranked.begin(), Ranked.end() );
  QStringList Names;
  for ( const auto& [Distance, rName] : Ranked )
  {
    if ( Names.size() < i_Most )
    {
      Names << rName;
    }
  }
  return Names;
}

} // namespace HostWindow
