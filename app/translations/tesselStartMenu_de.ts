<?xml version="1.0" encoding="utf-8"?>
<!DOCTYPE TS>
<TS version="2.1" language="de">
<context>
    <name>SMMenuWindowController</name>
    <message>
        <source>Menu Settings…</source>
        <translation>Menü-Einstellungen …</translation>
    </message>
    <message>
        <source>Back</source>
        <translation>Zurück</translation>
    </message>
    <message>
        <source>All Programs</source>
        <translation>Alle Programme</translation>
    </message>
</context>
<context>
    <name>SMSearchField</name>
    <message>
        <source>Clear</source>
        <translation>Löschen</translation>
    </message>
</context>
<context>
    <name>SMStatusItemView</name>
    <message>
        <source>Start menu</source>
        <translation>Startmenü</translation>
    </message>
</context>
<context>
    <name>menuWindow</name>
    <message>
        <source>Start menu</source>
        <translation>Startmenü</translation>
    </message>
    <message>
        <source>Virtual machine</source>
        <translation>Virtuelle Maschine</translation>
    </message>
    <message>
        <source>Search</source>
        <translation>Suchen</translation>
    </message>
    <message>
        <source>Search applications</source>
        <translation>Anwendungen suchen</translation>
    </message>
    <message>
        <source>Places and commands</source>
        <translation>Orte und Befehle</translation>
    </message>
    <message>
        <source>Applications</source>
        <translation>Anwendungen</translation>
    </message>
    <message>
        <source>Undo</source>
        <translation>Rückgängig</translation>
    </message>
    <message>
        <source>Cut</source>
        <translation>Ausschneiden</translation>
    </message>
    <message>
        <source>Copy</source>
        <translation>Kopieren</translation>
    </message>
    <message>
        <source>Paste</source>
        <translation>Einfügen</translation>
    </message>
    <message>
        <source>Select All</source>
        <translation>Alles auswählen</translation>
    </message>
    <message>
        <source>Menu Settings…</source>
        <translation>Menü-Einstellungen …</translation>
    </message>
    <message>
        <source>Close</source>
        <translation>Schließen</translation>
    </message>
    <message numerus="yes">
        <source>%n result(s)</source>
        <translation>
            <numerusform>%n Treffer</numerusform>
            <numerusform>%n Treffer</numerusform>
        </translation>
    </message>
</context>
</TS>
