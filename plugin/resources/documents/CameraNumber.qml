import QtQuick

// The number of a camera where it stands in the scene.
Item {
    id: root

    required property var modelData
    property bool shown: false

    x: modelData.position.x - width / 2
    y: modelData.position.y - height / 2
    z: 1 - modelData.position.z
    width: 40
    height: 40
    visible: modelData.calibrated

    Rectangle {
        anchors.centerIn: parent
        width: Math.max(24, label.implicitWidth + 12)
        height: 20
        radius: 5
        color: root.shown ? "#A0000000" : "#00000000"

        Behavior on color {
            ColorAnimation { duration: 100 }
        }

        Text {
            id: label

            anchors.centerIn: parent
            opacity: root.shown ? 1 : 0
            text: root.modelData.userId === 4294967295 ? "-" : root.modelData.userId
            color: root.modelData.selected ? "#E76500" : "#F0F0F0"
            font.pixelSize: 13

            Behavior on opacity {
                NumberAnimation { duration: 100 }
            }
        }
    }
}
