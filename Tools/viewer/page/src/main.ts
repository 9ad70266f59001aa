import './style.css';
import { App } from './app';

new App().start();
