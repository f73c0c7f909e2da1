#pragma once

#include <HarrowPluginInterface/IHarrowServices.h>

#include <QtQml/QQmlPropertyMap>
#include <QtQuickWidgets/QQuickWidget>

#include <memory>

class QQmlComponent;
class QQmlContext;

namespace ZEK
{

/// A widget that shows a QML document.
class IQuickWidget
{
public:
  virtual ~IQuickWidget() = default;
  virtual QWidget* Widget() = 0;
};

} // namespace ZEK

namespace MoxelQtQuick
{

/// Shows one QML document on the host's engine, with context properties of its own.
///
/// Several widgets share one engine and its root context, so each keeps a child context and creates its document in
/// that one. Every document sees `contextQuickWidget` (this widget) and `contextPersistentProperties` (a map that is
/// saved with the window). Thread: GUI.
class VQuickWidget : public QQuickWidget, public ZEK::IQuickWidget
{
  Q_OBJECT

public:
  explicit VQuickWidget( std::shared_ptr< HarrowPluginInterface::IHarrowQuickHost > i_pQuickHost,
                         QWidget* i_pParent = nullptr );
  ~VQuickWidget() override;

  QWidget* Widget() override { return this; }
  QQmlPropertyMap& PersistentProperties() { return m_PersistentProperties; }

  /// Publishes or replaces a property of this widget's documents.
  void SetContextProperty( const QString& i_rName, const QVariant& i_rValue );
  /// Of another name than the one above, because a literal 0 would be taken for an object.
  void SetContextObject( const QString& i_rName, QObject* i_pValue );
  QVariant ContextProperty( const QString& i_rName ) const;

  /// Loads the document in this widget's context. Load errors go to the log, category "MoxelQtQuick", and leave
  /// the widget without a root object.
  void LoadDocument( const QUrl& i_rUrl );

protected:
  /// Ends the document. A derived class whose members the document reads calls it first thing in its destructor.
  void CloseDocument();
  const std::shared_ptr< HarrowPluginInterface::IHarrowQuickHost >& QuickHost() const { return m_pQuickHost; }

private:
  void OnComponentStatus();

  std::shared_ptr< HarrowPluginInterface::IHarrowQuickHost > m_pQuickHost;
  QQmlContext* m_pContext; ///< a child object of the widget
  QQmlPropertyMap m_PersistentProperties;
  QQmlComponent* m_pComponent = nullptr; ///< a child object of the widget
};

} // namespace MoxelQtQuick
