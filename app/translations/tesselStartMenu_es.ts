<?xml version="1.0" encoding="utf-8"?>
<!DOCTYPE TS>
<TS version="2.1" language="es">
<context>
    <name>SMMenuWindowController</name>
    <message>
        <source>Menu Settings…</source>
        <translation>Ajustes del menú…</translation>
    </message>
    <message>
        <source>Back</source>
        <translation>Atrás</translation>
    </message>
    <message>
        <source>All Programs</source>
        <translation>Todos los programas</translation>
    </message>
</context>
<context>
    <name>SMSearchField</name>
    <message>
        <source>Clear</source>
        <translation>Borrar</translation>
    </message>
</context>
<context>
    <name>SMStatusItemView</name>
    <message>
        <source>Start menu</source>
        <translation>Menú Inicio</translation>
    </message>
</context>
<context>
    <name>menuWindow</name>
    <message>
        <source>Start menu</source>
        <translation>Menú Inicio</translation>
    </message>
    <message>
        <source>Virtual machine</source>
        <translation>Máquina virtual</translation>
    </message>
    <message>
        <source>Search</source>
        <translation>Buscar</translation>
    </message>
    <message>
        <source>Search applications</source>
        <translation>Buscar aplicaciones</translation>
    </message>
    <message>
        <source>Places and commands</source>
        <translation>Lugares y órdenes</translation>
    </message>
    <message>
        <source>Applications</source>
        <translation>Aplicaciones</translation>
    </message>
    <message>
        <source>Undo</source>
        <translation>Deshacer</translation>
    </message>
    <message>
        <source>Cut</source>
        <translation>Cortar</translation>
    </message>
    <message>
        <source>Copy</source>
        <translation>Copiar</translation>
    </message>
    <message>
        <source>Paste</source>
        <translation>Pegar</translation>
    </message>
    <message>
        <source>Select All</source>
        <translation>Seleccionar todo</translation>
    </message>
    <message>
        <source>Menu Settings…</source>
        <translation>Ajustes del menú…</translation>
    </message>
    <message>
        <source>Close</source>
        <translation>Cerrar</translation>
    </message>
    <message numerus="yes">
        <source>%n result(s)</source>
        <translation>
            <numerusform>%n resultado</numerusform>
            <numerusform>%n resultados</numerusform>
        </translation>
    </message>
</context>
</TS>
