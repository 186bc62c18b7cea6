<?xml version="1.0" encoding="utf-8"?>
<!DOCTYPE TS>
<TS version="2.1" language="fi">
<context>
    <name></name>
    <message>
        <source>tone-a</source>
        <translation>Suomi A</translation>
    </message>
    <message>
        <source>tone-e</source>
        <translation type="unfinished"></translation>
    </message>
</context>
</TS>
