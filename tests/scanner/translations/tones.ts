<?xml version="1.0" encoding="utf-8"?>
<!DOCTYPE TS>
<TS version="2.1" language="en">
<context>
    <name></name>
    <message>
        <source>tone-a</source>
        <translation>Plain A</translation>
    </message>
    <message>
        <source>tone-e</source>
        <translation type="unfinished"></translation>
    </message>
</context>
</TS>
