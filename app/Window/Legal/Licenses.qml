import QtQuick 2.15
import QtQuick.Controls 2.15
import QtQuick.Layouts 1.15
import Lumek.Theme 1.0

// The third-party licences: the components on the left, the chosen one's licence on the right.
// Colours and sizes come from the application theme, so the page matches the widgets around it.
Rectangle {
    id: page

    signal closeRequested()

    // Brackets, because a capitalised name after a type would be read as an enumeration.
    readonly property int margin: Theme["Margin"]
    readonly property int spacing: Theme["ItemSpacing"]
    property int current: 0

    color: Theme["Window"]
    implicitWidth: 900
    implicitHeight: 620

    ColumnLayout {
        anchors.fill: parent
        anchors.margins: page.margin
        spacing: page.spacing * 2

        Text {
            text: "This program is built with the following open-source components."
            color: Theme["WindowText"]
            font.pointSize: Theme["PointSizeHeader"]
            Layout.fillWidth: true
            wrapMode: Text.WordWrap
        }

        RowLayout {
            Layout.fillWidth: true
            Layout.fillHeight: true
            spacing: page.spacing * 2

            Rectangle {
                Layout.preferredWidth: 220
                Layout.fillHeight: true
                color: Theme["Base"]
                border.color: Theme["FieldBorder"]

                ListView {
                    id: list
                    objectName: "ComponentList"
                    anchors.fill: parent
                    anchors.margins: 1
                    clip: true
                    model: legalComponents
                    currentIndex: page.current
                    delegate: Rectangle {
                        width: list.width
                        height: Theme["ItemHeight"] * 2
                        color: index === page.current ? Theme["Highlight"]
                                                      : (index % 2 ? Theme["AlternateBase"] : Theme["Base"])
                        Column {
                            anchors.verticalCenter: parent.verticalCenter
                            anchors.left: parent.left
                            anchors.leftMargin: page.margin
                            Text {
                                text: modelData.name
                                color: index === page.current ? Theme["HighlightedText"] : Theme["Text"]
                                font.bold: true
                                font.pointSize: Theme["PointSizeNormal"]
                            }
                            Text {
                                text: modelData.licence
                                color: index === page.current ? Theme["HighlightedText"] : Theme["WindowTextDisabled"]
                                font.pointSize: Theme["PointSizeNormal"] - 1
                                elide: Text.ElideRight
                                width: list.width - 2 * page.margin
                            }
                        }
                        MouseArea {
                            anchors.fill: parent
                            onClicked: page.current = index
                        }
                    }
                }
            }

            ColumnLayout {
                Layout.fillWidth: true
                Layout.fillHeight: true
                spacing: page.spacing

                Text {
                    objectName: "ComponentTitle"
                    text: legalComponents[page.current].name + " \u2014 " + legalComponents[page.current].licence
                    color: Theme["Bright"]
                    font.bold: true
                    font.pointSize: Theme["PointSizeHeader"]
                    Layout.fillWidth: true
                    elide: Text.ElideRight
                }
                Text {
                    text: legalComponents[page.current].copyright
                    color: Theme["WindowText"]
                    font.pointSize: Theme["PointSizeNormal"]
                    Layout.fillWidth: true
                    wrapMode: Text.WordWrap
                }
                Rectangle {
                    Layout.fillWidth: true
                    Layout.fillHeight: true
                    color: Theme["Base"]
                    border.color: Theme["FieldBorder"]

                    Flickable {
                        id: flick
                        anchors.fill: parent
                        anchors.margins: page.margin
                        clip: true
                        contentWidth: width
                        contentHeight: licenceText.paintedHeight
                        ScrollBar.vertical: ScrollBar { }

                        Text {
                            id: licenceText
                            objectName: "LicenceText"
                            width: flick.width - Theme["ScrollBarWidth"]
                            text: legalComponents[page.current].text
                            color: Theme["Text"]
                            font.family: "monospace"
                            font.pointSize: Theme["PointSizeNormal"]
                            wrapMode: Text.WrapAtWordBoundaryOrAnywhere
                            textFormat: Text.PlainText
                        }
                    }
                }
            }
        }

        Rectangle {
            id: closeButton
            Layout.alignment: Qt.AlignRight
            implicitWidth: Theme["ButtonWidth"]
            implicitHeight: Theme["ButtonHeight"]
            radius: Theme["ButtonRadius"]
            color: closeArea.containsMouse ? Theme["ButtonHover"] : Theme["Button"]
            border.color: Theme["ButtonBorder"]
            Text {
                anchors.centerIn: parent
                text: "Close"
                color: Theme["ButtonText"]
                font.pointSize: Theme["PointSizeNormal"]
            }
            MouseArea {
                id: closeArea
                anchors.fill: parent
                hoverEnabled: true
                onClicked: page.closeRequested()
            }
        }
    }
}
