#pragma once

// moc trips over the standard library's concepts unless Qt comes first.
#include <QtWidgets/QAbstractSpinBox>

#include "PreferenceItems.h"

namespace HostWindow
{

/// A spin box for every number type of a store. What is typed is free until Enter or until the focus leaves, so that
/// a number out of the range can be named in a message instead of keys that do nothing.
class VNumberBox final : public QAbstractSpinBox
{
  Q_OBJECT

public:
  explicit VNumberBox( const VPreferenceItem& i_rItem, QWidget* i_pParent = nullptr );
  ~VNumberBox() override;

  void Show( const ZEK::VTypedValue& i_rValue );
  /// Unfinished text gives way to the value shown last; false when there was none.
  bool Revert();

signals:
  void Edited( const ZEK::VTypedValue& i_rValue );
  /// The text is no number of the type.
  void Refused( const QString& i_rWhy );

protected:
  void stepBy( int i_Steps ) override;
  StepEnabled stepEnabled() const override;
  QValidator::State validate( QString&, int& ) const override { return QValidator::Acceptable; }
  void wheelEvent( QWheelEvent* io_pEvent ) override;

private:
  /// Empty when the text is no number of the type.
  ZEK::VTypedValue Typed() const;
  QString TextOf( const ZEK::VTypedValue& i_rValue ) const;
  void Finish();

  VPreferenceItem m_Item;
  ZEK::VTypedValue m_Value;
};

} // namespace HostWindow
