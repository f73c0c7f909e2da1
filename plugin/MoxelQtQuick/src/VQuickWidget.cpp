#include <MoxelQtQuick/VQuickWidget.h>

#include <ZEK/Log.h>

#include <QtQml/QQmlComponent>
#include <QtQml/QQmlContext>
#include <QtQml/QQmlEngine>
#include <QtQuick/QQuickItem>

namespace MoxelQtQuick
{
namespace
{
ZEK::VLogCategory& Category()
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "MoxelQtQuick" );
  return rCategory;
}
} // namespace

VQuickWidget::VQuickWidget( std::shared_ptr< HarrowPluginInterface::IHarrowQuickHost > i_pQuickHost,
                            QWidget* i_pParent )
  : QQuickWidget( i_pQuickHost->Engine(), i_pParent )
  , m_pQuickHost( std::move( i_pQuickHost ) )
  , m_pContext( new QQmlContext( m_pQuickHost->Engine()->rootContext(), this ) )
{
  SetContextObject( "contextQuickWidget", this );
  SetContextObject( "contextPersistentProperties", &m_PersistentProperties );
}

VQuickWidget::~VQuickWidget()
{
  CloseDocument();
}

void VQuickWidget::CloseDocument()
{
  delete rootObject();
}

void VQuickWidget::SetContextProperty( const QString& i_rName, const QVariant& i_rValue )
{
  m_pContext->setContextProperty( i_rName, i_rValue );
}

void VQuickWidget::SetContextObject( const QString& i_rName, QObject* i_pValue )
{
  m_pContext->setContextProperty( i_rName, i_pValue );
}

QVariant VQuickWidget::ContextProperty( const QString& i_rName ) const
{
  return m_pContext->contextProperty( i_rName );
}

void VQuickWidget::LoadDocument( const QUrl& i_rUrl )
{
  delete m_pComponent;
  m_pComponent = new QQmlComponent( engine(), i_rUrl, this );
  if ( m_pComponent->isLoading() )
  {
    connect( m_pComponent, &QQmlComponent::statusChanged, this,
             [this]
             {
               OnComponentStatus();
             } );
    return;
  }
  OnComponentStatus();
}

void VQuickWidget::OnComponentStatus()
{
  QObject* const pObject = m_pComponent->isReady() ? m_pComponent->create( m_pContext ) : nullptr;
  for ( const QQmlError& rError : m_pComponent->errors() )
  {
    ZEK::Log( Category(), ZEK::ELogFailure, "%1%", rError.toString().toStdString() );
  }
  if ( !pObject )
  {
    return;
  }
  if ( !qobject_cast< QQuickItem* >( pObject ) )
  {
    ZEK::Log( Category(), ZEK::ELogFailure, "The root of %1% is not an item",
              m_pComponent->url().toString().toStdString() );
    delete pObject;
    return;
  }
  setContent( m_pComponent->url(), m_pComponent, pObject );
}

} // namespace MoxelQtQuick
