#pragma once

#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtGui/QColor>
#include <QtGui/QVector3D>

namespace MoxelGraphics
{

/// A calibrated camera in front of the eye of a view, for documents. Thread: GUI.
class VCameraObject : public QObject
{
  Q_OBJECT
  Q_PROPERTY( QString deviceURN READ DeviceURN CONSTANT )
  Q_PROPERTY( quint32 userId MEMBER m_UserId NOTIFY Changed )
  Q_PROPERTY( bool calibrated MEMBER m_bCalibrated NOTIFY Changed )
  Q_PROPERTY( QVector3D position MEMBER m_Position NOTIFY PositionChanged )
  Q_PROPERTY( bool selected MEMBER m_bSelected NOTIFY Changed )
  Q_PROPERTY( bool preselected MEMBER m_bPreselected NOTIFY Changed )

public:
  explicit VCameraObject( QString i_DeviceURN, QObject* i_pParent = nullptr )
    : QObject( i_pParent )
    , m_DeviceURN( std::move( i_DeviceURN ) )
  {
  }
  const QString& DeviceURN() const { return m_DeviceURN; }

  quint32 m_UserId = 0; ///< 4294967295 for a camera without a number
  bool m_bCalibrated = false;
  QVector3D m_Position; ///< item x, item y (px from the top left), window depth 0 to 1
  bool m_bSelected = false;
  bool m_bPreselected = false;

signals:
  void Changed();
  void PositionChanged();

private:
  QString m_DeviceURN;
};

/// A named subject, for documents. Thread: GUI.
class VSubjectObject : public QObject
{
  Q_OBJECT
  Q_PROPERTY( QString name MEMBER m_Name NOTIFY Changed )
  Q_PROPERTY( quint32 kind READ Kind CONSTANT )
  Q_PROPERTY( QColor colour MEMBER m_Colour NOTIFY Changed )
  Q_PROPERTY( QVector3D position MEMBER m_Position NOTIFY PositionChanged )
  Q_PROPERTY( bool selected MEMBER m_bSelected NOTIFY Changed )

public:
  explicit VSubjectObject( quint32 i_Kind, QObject* i_pParent = nullptr )
    : QObject( i_pParent )
    , m_Kind( i_Kind )
  {
  }
  /// A ZEK::ESelectionKind.
  quint32 Kind() const { return m_Kind; }

  QString m_Name;
  QColor m_Colour;
  QVector3D m_Position; ///< item x, item y (px from the top left), distance from the eye in mm; -1 behind the eye
  bool m_bSelected = false;

signals:
  void Changed();
  void PositionChanged();

private:
  quint32 m_Kind;
};

} // namespace MoxelGraphics
