<?xml version="1.0" encoding="utf-8"?>
<!DOCTYPE TS>
<TS version="2.1" language="en">
<context>
    <name>SMMenuWindowController</name>
    <message>
        <source>Menu Settings…</source>
        <translation>Menu Settings…</translation>
    </message>
    <message>
        <source>Back</source>
        <translation>Back</translation>
    </message>
    <message>
        <source>All Programs</source>
        <translation>All Programs</translation>
    </message>
</context>
<context>
    <name>SMSearchField</name>
    <message>
        <source>Clear</source>
        <translation>Clear</translation>
    </message>
</context>
<context>
    <name>SMStatusItemView</name>
    <message>
        <source>Start menu</source>
        <translation>Start menu</translation>
    </message>
</context>
<context>
    <name>menuWindow</name>
    <message>
        <source>Start menu</source>
        <translation>Start menu</translation>
    </message>
    <message>
        <source>Virtual machine</source>
        <translation>Virtual machine</translation>
    </message>
    <message>
        <source>Search</source>
        <translation>Search</translation>
    </message>
    <message>
        <source>Search applications</source>
        <translation>Search applications</translation>
    </message>
    <message>
        <source>Places and commands</source>
        <translation>Places and commands</translation>
    </message>
    <message>
        <source>Applications</source>
        <translation>Applications</translation>
    </message>
    <message>
        <source>Undo</source>
        <translation>Undo</translation>
    </message>
    <message>
        <source>Cut</source>
        <translation>Cut</translation>
    </message>
    <message>
        <source>Copy</source>
        <translation>Copy</translation>
    </message>
    <message>
        <source>Paste</source>
        <translation>Paste</translation>
    </message>
    <message>
        <source>Select All</source>
        <translation>Select All</translation>
    </message>
    <message>
        <source>Menu Settings…</source>
        <translation>Menu Settings…</translation>
    </message>
    <message>
        <source>Close</source>
        <translation>Close</translation>
    </message>
    <message numerus="yes">
        <source>%n result(s)</source>
        <translation>
            <numerusform>%n result</numerusform>
            <numerusform>%n results</numerusform>
        </translation>
    </message>
</context>
</TS>
